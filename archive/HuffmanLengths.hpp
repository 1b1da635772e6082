#pragma once

#include <cstdint>
#include <span>
#include <vector>

namespace tessel::archive {

// Code lengths of a Huffman code (Huffman 1952, built with two queues: van
// Leeuwen 1976) for the symbols with a count above 0. No length is above
// maxBits: as long as one is, all counts are raised by a small share of their
// total, which flattens the code. The code is complete; a single symbol and
// symbols without a count get length 0.
//
// maxBits must allow for that many symbols. Cost: one sort per round; one
// round is the rule.
std::vector<std::uint8_t> huffmanLengths(std::span<const std::uint64_t> counts,
                                         unsigned maxBits);

// The canonical codes of these lengths; 0 where the length is 0.
std::vector<std::uint32_t> canonicalCodes(
    std::span<const std::uint8_t> lengths);

}  // namespace tessel::archive
