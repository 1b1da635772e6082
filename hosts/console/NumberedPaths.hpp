#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "archive/PathArchive.hpp"
#include "hosts/console/PathOutput.hpp"
#include "hosts/console/ProgressBar.hpp"

namespace tessel::console {

// NumberedPaths writes the paths of numbers, in the order in which they are
// added. It fetches many at a time, so that neighbours share the decoding.
//
// Ownership: borrows archive, output and bar.
class NumberedPaths {
public:
    // bar  is told how many paths are written
    NumberedPaths(const PathArchive& archive, PathOutput& output,
                  ProgressBar& bar);

    // The number must be in the archive.
    void add(std::uint64_t number);
    void add(const NumberRange& range);

    // Writes what is left.
    void flush();

private:
    // One fetch. From 1,024 on, sorted and random numbers cost the same per
    // path as in one fetch of a million.
    static constexpr std::size_t maxNumbers = 4096;

    const PathArchive* archive_;
    PathOutput* output_;
    ProgressBar* bar_;
    std::vector<std::uint64_t> numbers_;
    std::uint64_t written_ = 0;
};

}  // namespace tessel::console
