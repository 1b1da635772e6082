#include "hosts/console/PathRange.hpp"

#include <charconv>
#include <limits>
#include <system_error>

namespace tessel::console {

namespace {

using Limits = std::numeric_limits<std::int64_t>;

// Reads a number at the start of the text and removes it. One that does not
// fit becomes the nearest that does; no list is so long.
std::optional<std::int64_t> takeNumber(std::string_view& text) noexcept {
    std::int64_t number = 0;
    const auto [end, error] =
        std::from_chars(text.data(), text.data() + text.size(), number);
    if (error == std::errc::result_out_of_range)
        number = text.front() == '-' ? Limits::min() : Limits::max();
    else if (error != std::errc())
        return std::nullopt;
    text.remove_prefix(static_cast<std::size_t>(end - text.data()));
    return number;
}

std::optional<std::uint64_t> resolveEnd(std::int64_t number,
                                        std::uint64_t size) noexcept {
    const auto offset = static_cast<std::uint64_t>(number);
    // Counted from the end, the sum wraps to the number that is meant.
    const std::uint64_t resolved = number < 0 ? size + offset : offset;
    if (resolved >= size) return std::nullopt;
    return resolved;
}

}  // namespace

std::optional<PathRange> parsePathRange(std::string_view text) noexcept {
    const auto first = takeNumber(text);
    if (!first) return std::nullopt;
    if (text.empty()) return PathRange{*first, *first};
    if (text.front() != '-') return std::nullopt;
    text.remove_prefix(1);
    const auto last = takeNumber(text);
    if (!last || !text.empty()) return std::nullopt;
    return PathRange{*first, *last};
}

std::optional<tessel::NumberRange> resolve(const PathRange& range,
                                           std::uint64_t size) noexcept {
    const auto first = resolveEnd(range.first, size);
    const auto last = resolveEnd(range.last, size);
    if (!first || !last || *last < *first) return std::nullopt;
    return tessel::NumberRange{*first, *last + 1};
}

}  // namespace tessel::console
