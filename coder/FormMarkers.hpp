#pragma once

#include <cstdint>

// What begins a group of a coder's stored form (HuffmanPathTreeForm.cpp).
// Stored as bytes; never change them.
namespace tessel::formmarkers {

constexpr std::uint8_t partitions = 0x01;
constexpr std::uint8_t duplicates = 0x00;

}  // namespace tessel::formmarkers
