#pragma once

#include "binding/HostAccess.hpp"

// The seven methods of HuffmanPaths. Each checks its argument counts (outputs,
// then too many inputs, then too few) before anything else, fetches the
// instance's coder, and fills its outputs last, so that a method that throws
// hands nothing out.
namespace tessel {

struct SignatureReleaser {
    void operator()(HostSignature* signature) const noexcept;
};
using OwnedSignature = std::unique_ptr<HostSignature, SignatureReleaser>;

// HuffmanPathsMethod is what the seven have in common.
//
// Ownership: holds its signature, a host object, and releases it with itself.
class HuffmanPathsMethod : public HostMethodInfo {
public:
    const HostSignature* signature() const noexcept final {
        return ownSignature_.get();
    }
    void execute(HostFrame& frame) final;

protected:
    explicit HuffmanPathsMethod(OwnedSignature heldSignature) noexcept
        : ownSignature_(std::move(heldSignature)) {}

private:
    // The method body.
    virtual void run(HostFrame& frame) const = 0;

    OwnedSignature ownSignature_;
};

// A descriptor is named after its class and its method.
// NOLINTBEGIN(readability-identifier-naming)

// Fills the new instance in output slot 1 in one of the modes "tree",
// "frequencies", "copy" and "files"; any other combination of mode word and
// input count leaves it empty.
class HuffmanPaths_Constructor final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_Constructor(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "HuffmanPaths"; }

private:
    void run(HostFrame& frame) const override;
};

// Adds folders and their files. Everything is converted and checked before the
// coder is touched. A path that is also a folder of another path must be kept
// apart by the caller (see HuffmanPathTree).
class HuffmanPaths_AddPaths final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_AddPaths(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "addPaths"; }

private:
    void run(HostFrame& frame) const override;
};

// Answers paths by number: as components, or joined with a separator.
class HuffmanPaths_GetPaths final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_GetPaths(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "getPaths"; }

private:
    void run(HostFrame& frame) const override;
};

class HuffmanPaths_GetNextPath final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_GetNextPath(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "getNextPath"; }

private:
    void run(HostFrame& frame) const override;
};

// Fills output slot 1 also when no output was requested.
class HuffmanPaths_HasNextPath final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_HasNextPath(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "hasNextPath"; }

private:
    void run(HostFrame& frame) const override;
};

class HuffmanPaths_ResetPathTree final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_ResetPathTree(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "reset"; }

private:
    void run(HostFrame& frame) const override;
};

// Answers the tree string and, for two outputs only, the stored form.
class HuffmanPaths_Serialize final : public HuffmanPathsMethod {
public:
    explicit HuffmanPaths_Serialize(OwnedSignature held) noexcept
        : HuffmanPathsMethod(std::move(held)) {}
    const char* name() const noexcept override { return "serialize"; }

private:
    void run(HostFrame& frame) const override;
};

// NOLINTEND(readability-identifier-naming)

}  // namespace tessel
