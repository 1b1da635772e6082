#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "archive/PathArchive.hpp"
#include "hosts/console/PathOutput.hpp"

namespace tessel::console {

// NumberedPaths writes the paths of numbers, in the order in which they are
// added. It fetches many at a time, so that neighbours share the decoding.
//
// Ownership: borrows archive and output.
class NumberedPaths {
public:
    NumberedPaths(const PathArchive& archive, PathOutput& output);

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
    std::vector<std::uint64_t> numbers_;
};

}  // namespace tessel::console
