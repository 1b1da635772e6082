#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "archive/ArchiveReader.hpp"
#include "archive/PathCursor.hpp"

namespace tessel::archive {

// SequentialReader reads the paths of an archive one by one, in the order of
// their numbers, wherever they are stored.
//
// Ownership: borrows the archive.
// Threads: one thread at a time.
class SequentialReader {
public:
    explicit SequentialReader(const ArchiveReader& archive) noexcept
        : archive_(archive) {}

    // The path with the next number, which must be below the archive's size.
    // Valid until the next call. Throws DamagedArchiveException.
    std::string_view next();

    // The number of the path that next() returns.
    std::uint64_t number() const noexcept { return number_; }

private:
    void enterSegment();

    const ArchiveReader& archive_;
    std::optional<PathCursor> paths_;  // in the segment of the last path
    const Segment* segment_ = nullptr;
    std::uint64_t segmentEnd_ = 0;
    std::uint64_t number_ = 0;
};

}  // namespace tessel::archive
