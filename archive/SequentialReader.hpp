#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/PathBatch.hpp"
#include "archive/PathCursor.hpp"

namespace tessel::archive {

// SequentialReader reads the paths of an archive one by one, in the order of
// their numbers, wherever they are stored: a rearranged segment in batches.
//
// Ownership: borrows the archive.
// Threads: one thread at a time.
// Cost: that of a cursor, and in a rearranged segment that of a batch.
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
    void fillBatch();
    std::string_view nextInBatch();

    const ArchiveReader& archive_;
    std::optional<PathCursor> paths_;  // in the segment of the last path
    std::optional<PathBatch> batch_;   // if that segment is rearranged
    std::size_t nextInBatch_ = 0;
    std::vector<std::uint32_t> places_;
    const Segment* segment_ = nullptr;
    std::uint64_t segmentEnd_ = 0;
    std::uint64_t number_ = 0;
};

}  // namespace tessel::archive
