#include "hosts/console/Quantities.hpp"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <string_view>

namespace tessel::console {

namespace {

// value in the greatest of the units, each 1,000 of the one before, in which
// it is at least 1, with three digits.
std::string scaled(double value, const std::array<std::string_view, 5>& units) {
    // 999.5 would be shown as 1000.
    std::size_t unit = 0;
    while (value >= 999.5 && unit + 1 < units.size()) {
        value /= 1000;
        ++unit;
    }
    int decimals = 0;
    if (unit > 0 && value < 99.95) decimals = value < 9.995 ? 2 : 1;
    return fmt::format("{:.{}f}{}", value, decimals, units.at(unit));
}

}  // namespace

std::string groupedText(std::uint64_t number) {
    const std::string digits = std::to_string(number);
    std::string text;
    for (std::size_t i = 0; i < digits.size(); ++i) {
        if (i > 0 && (digits.size() - i) % 3 == 0) text.push_back(',');
        text.push_back(digits[i]);
    }
    return text;
}

std::string bytesText(double bytes) {
    return scaled(bytes, {" B", " kB", " MB", " GB", " TB"});
}

std::string countText(double count) {
    return scaled(count, {"", " k", " M", " G", " T"});
}

std::string durationText(double seconds) {
    // An estimate from the first moments may be absurd.
    constexpr double most = 359'999;
    const auto whole =
        static_cast<std::uint64_t>(std::lround(std::clamp(seconds, 0.0, most)));
    const std::uint64_t minutes = whole / 60;
    if (minutes < 60) return fmt::format("{}:{:02}", minutes, whole % 60);
    return fmt::format("{}:{:02}:{:02}", minutes / 60, minutes % 60,
                       whole % 60);
}

}  // namespace tessel::console
