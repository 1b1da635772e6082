#pragma once

#include <cstdint>
#include <span>
#include <vector>

namespace tessel::archive {

// Where an archive is written to, front to back. Nothing can be seen of it
// until `commit`; a target that is destroyed before leaves no trace.
class ArchiveTarget {
public:
    using Bytes = std::span<const std::uint8_t>;

    virtual ~ArchiveTarget() = default;

    virtual void append(Bytes bytes) = 0;
    // Replaces the first bytes, which were appended before.
    virtual void rewriteStart(Bytes bytes) = 0;
    // Puts what was appended in its place, at once. Called at most once.
    virtual void commit() = 0;

protected:
    ArchiveTarget() = default;
    ArchiveTarget(const ArchiveTarget&) = default;
    ArchiveTarget& operator=(const ArchiveTarget&) = default;
};

// Replaces the contents of a vector, which must outlive the target.
class MemoryTarget final : public ArchiveTarget {
public:
    explicit MemoryTarget(std::vector<std::uint8_t>& out) : out_(out) {}

    void append(Bytes bytes) override;
    void rewriteStart(Bytes bytes) override;
    void commit() override;

private:
    std::vector<std::uint8_t>& out_;
    std::vector<std::uint8_t> bytes_;
};

}  // namespace tessel::archive
