#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

namespace tessel::archive {

// A string to be sorted and its number.
struct StringItem {
    std::string_view text;
    std::uint64_t key = 0;  // used by sortStrings
    std::uint32_t number = 0;
};

// Sorts by the strings' bytes, unsigned; equal strings by number.
//
// Multikey quicksort (Bentley and Sedgewick 1997) on eight bytes at a time,
// so bytes that many strings share are compared once per level instead of
// once per comparison. Not recursive. The strings hold no zero byte.
void sortStrings(std::span<StringItem> items);

}  // namespace tessel::archive
