#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "archive/BitLoad.hpp"
#include "archive/NumberRange.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// The numbers of section Order or Index: of each path's number its place, or of
// each place in the order of the paths' bytes the number.
//
// Ownership: borrows the segment.
// Threads: const members from any number of threads.
class PackedNumbers {
public:
    PackedNumbers(const Segment& segment, Section section) noexcept
        : segment_(&segment),
          stream_(segment.dataOf(section)),
          bits_(segment.head().numberBits()),
          section_(section) {}

    // Number i, which must be below the segment's size; so is the result.
    // Throws DamagedArchiveException.
    std::uint32_t at(std::uint64_t i) const {
        const std::uint64_t bit = i * bits_;
        const std::uint64_t begin = bit / 8;
        segment_->require(section_, begin, (bit + bits_ + 7) / 8 - begin);
        const std::uint64_t number = loadBits(stream_, bit) >> (64 - bits_);
        if (number >= segment_->size()) [[unlikely]]
            segment_->fail(section_, begin, "A number is too large.");
        return static_cast<std::uint32_t>(number);
    }

    void prefetch(std::uint64_t i) const noexcept {
        __builtin_prefetch(stream_ + i * bits_ / 8);
    }

private:
    const Segment* segment_;
    const std::uint8_t* stream_;
    unsigned bits_;
    Section section_;
};

// The numbers at these places of a section, as ranges. Throws
// DamagedArchiveException.
inline std::vector<NumberRange> sortedNumbers(const PackedNumbers& numbers,
                                              NumberRange places) {
    std::vector<std::uint32_t> sorted;
    for (auto place = places.begin; place < places.end; ++place)
        sorted.push_back(numbers.at(place));
    std::ranges::sort(sorted);
    std::vector<NumberRange> ranges;
    for (const std::uint64_t number : sorted)
        appendRange(ranges, {number, number + 1});
    return ranges;
}

}  // namespace tessel::archive
