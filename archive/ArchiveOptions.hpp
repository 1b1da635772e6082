#pragma once

#include <cstdint>
#include <functional>
#include <stop_token>

#include "archive/Format.hpp"

namespace tessel {

// How much time to spend on size. Size and time per path, against Normal:
//
//   | level  | size       | time |
//   |--------|------------|------|
//   | Fast   | 5-6 % more | 0.65 |
//   | Normal | 1          | 1    |
//   | Best   | 2-3 % less | 4    |
//
// Measured on a million neighbouring paths of a distribution's archive, and on
// a million drawn from all of it.
enum class ArchiveLevel : std::uint8_t { Fast, Normal, Best };

// Whether lists that are not sorted get an index, so that finding a path by
// its text takes microseconds instead of a scan. Costs log2 of the number of
// paths in bits per path: 2.5 bytes at a million. Sorted lists need none.
enum class ArchiveIndex : std::uint8_t { None, WhereNeeded };

// What a progress callback is told. `share` runs from 0 to 1 for each segment.
struct ArchiveProgress {
    std::uint64_t pathsWritten = 0;  // in finished segments
    std::uint64_t pathsAdded = 0;
    double share = 0;  // of the segment that is being built
};

struct ArchiveOptions {
    ArchiveLevel level = ArchiveLevel::Normal;
    ArchiveIndex index = ArchiveIndex::None;
    // 0: as many as there are cores. The bytes do not depend on it.
    unsigned threads = 0;
    // Called on the thread that calls the writer, some ten times per segment.
    // What it throws ends the writing, and the target stays as it was.
    std::function<void(const ArchiveProgress&)> progress;
    // Looked at every few milliseconds while a segment is built.
    std::stop_token cancel;
    // A segment ends with whichever comes first. Smaller segments take less
    // memory to build and more room in the file. At most the defaults, at
    // least 1.
    std::uint64_t pathsPerSegment = archive::maxPathsPerSegment;
    std::uint64_t textPerSegment = archive::maxTextPerSegment;
};

}  // namespace tessel
