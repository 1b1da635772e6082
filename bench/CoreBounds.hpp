#pragma once

#include "bench/Report.hpp"
#include "paths/PathSplitter.hpp"

namespace bench {

// What the library's own parts cost on one list, beside what they cannot be
// faster or smaller than. Bytes, and ratios of times of the same run.
struct CoreBounds {
    std::size_t textBytes = 0;
    std::size_t inputBytes = 0;     // the lists of UTF-16 strings
    std::size_t usageBytes = 0;     // memoryUsage().total()
    std::size_t instanceBytes = 0;  // by the allocator
    std::size_t restoredBytes = 0;  // by the allocator
    std::size_t formBytes = 0;
    std::size_t addingPeak = 0;     // beyond the inputs
    std::size_t restoringPeak = 0;  // beyond the form
    double serializeToCompress = 0;
    double restoreToUncompress = 0;
    double destroyToBuild = 0;
    double twoWorkers = 0;  // encoding: one worker's time to that of two

    Json json() const;
};

// Measures it, the times `runs` times. The whole list is one batch.
CoreBounds measureCoreBounds(const tessel::paths::PathSplitter& splitter,
                             int runs);

}  // namespace bench
