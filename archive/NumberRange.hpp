#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

namespace tessel {

// Numbers from begin up to, but without, end.
struct NumberRange {
    std::uint64_t begin = 0;
    std::uint64_t end = 0;

    friend bool operator==(const NumberRange&, const NumberRange&) = default;
};

namespace archive {

// Adds a range whose numbers are all greater than those in the list, as a part
// of the last one if there is no gap between them.
inline void appendRange(std::vector<NumberRange>& list, NumberRange range) {
    if (range.begin == range.end) return;
    if (!list.empty() && list.back().end == range.begin)
        list.back().end = range.end;
    else
        list.push_back(range);
}

// How many chunks of `size` numbers a range has. The last one may be smaller.
constexpr std::uint64_t chunkCount(NumberRange range,
                                   std::uint64_t size) noexcept {
    return (range.end - range.begin + size - 1) / size;
}

// The chunk of this index, below chunkCount.
constexpr NumberRange chunkOf(NumberRange range, std::uint64_t size,
                              std::uint64_t index) noexcept {
    const std::uint64_t begin = range.begin + index * size;
    return {begin, std::min(begin + size, range.end)};
}

}  // namespace archive
}  // namespace tessel
