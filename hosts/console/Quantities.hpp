#pragma once

#include <cstdint>
#include <string>

// Numbers as people read them.
namespace tessel::console {

// 1234567 as "1,234,567".
std::string groupedText(std::uint64_t number);

// Three significant digits and a decimal unit: "950 B", "4.55 MB".
std::string bytesText(double bytes);

// Three significant digits: "950", "12.3 k", "7.30 M".
std::string countText(double count);

// "0:07", "12:34", "1:02:03".
std::string durationText(double seconds);

}  // namespace tessel::console
