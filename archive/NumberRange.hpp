#pragma once

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

}  // namespace archive
}  // namespace tessel
