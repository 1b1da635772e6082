#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <utility>

#include "binding/HostAccess.hpp"

// The seven methods of HuffmanPaths. Each checks its argument counts (outputs,
// then too many inputs, then too few) before anything else, fetches the
// instance's coder, and fills its outputs last, so that a method that throws
// has put nothing into the output slots.
namespace tessel::binding {

struct SignatureReleaser {
    void operator()(HostSignature* signature) const noexcept;
};
using OwnedSignature = std::unique_ptr<HostSignature, SignatureReleaser>;

// A text as a template argument.
template <std::size_t size>
struct FixedText {
    // NOLINTNEXTLINE(google-explicit-constructor): written as a plain literal
    constexpr FixedText(const char (&literal)[size]) {
        std::copy_n(literal, size, characters);
    }
    char characters[size] = {};
};

using MethodBody = void (*)(HostFrame& frame);

// Runs a method's body. An array that the host cannot allocate becomes the
// host's out-of-memory error.
void runReportingAllocationFailure(MethodBody body, HostFrame& frame);

// Method is the descriptor of one method: its name and body.
//
// Ownership: holds its signature, which the host made, and releases it in its
//   destructor.
template <FixedText methodName, MethodBody body>
class Method final : public HostMethodInfo {
public:
    explicit Method(OwnedSignature signature) noexcept
        : signature_(std::move(signature)) {}

    const char* name() const noexcept override { return methodName.characters; }
    const HostSignature* signature() const noexcept override {
        return signature_.get();
    }
    void execute(HostFrame& frame) override {
        runReportingAllocationFailure(body, frame);
    }

private:
    OwnedSignature signature_;
};

// Fills the new instance in output slot 1 in one of the modes "tree",
// "frequencies", "copy" and "files"; any other combination of mode word and
// input count leaves it empty.
void construct(HostFrame& frame);

// Adds folders and their files. Everything is converted and checked before the
// coder is touched. A path that is also a folder of another path must be kept
// apart by the caller (see HuffmanPathTree).
void addPaths(HostFrame& frame);

// Returns paths by number: as components, or joined with a separator.
void getPaths(HostFrame& frame);

void getNextPath(HostFrame& frame);

// Fills output slot 1 also when no output was requested.
void hasNextPath(HostFrame& frame);

void reset(HostFrame& frame);

// Returns the tree string and, only if two outputs are requested, the stored
// form.
void serialize(HostFrame& frame);

// A descriptor is named after its class and its method.
// NOLINTBEGIN(readability-identifier-naming)
using HuffmanPaths_Constructor = Method<"HuffmanPaths", construct>;
using HuffmanPaths_AddPaths = Method<"addPaths", addPaths>;
using HuffmanPaths_GetPaths = Method<"getPaths", getPaths>;
using HuffmanPaths_GetNextPath = Method<"getNextPath", getNextPath>;
using HuffmanPaths_HasNextPath = Method<"hasNextPath", hasNextPath>;
using HuffmanPaths_ResetPathTree = Method<"reset", reset>;
using HuffmanPaths_Serialize = Method<"serialize", serialize>;
// NOLINTEND(readability-identifier-naming)

}  // namespace tessel::binding
