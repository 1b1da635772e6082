#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "archive/PathArchive.hpp"

namespace tessel::console {

// Paths as a user names them: "7", "-1" (the last), "2-5" or "-10--1", both
// ends included.
struct PathRange {
    std::int64_t first = 0;  // negative: counted from the end
    std::int64_t last = 0;

    friend bool operator==(const PathRange&, const PathRange&) = default;
};

// Reads a number or a range; nothing if the text is none. Numbers beyond 2^63
// become the nearest that fits, which no list has.
std::optional<PathRange> parsePathRange(std::string_view text) noexcept;

// The numbers of a list of this many paths that a range means; nothing if one
// of its ends is not in the list or the last is before the first.
std::optional<tessel::NumberRange> resolve(const PathRange& range,
                                           std::uint64_t size) noexcept;

}  // namespace tessel::console
