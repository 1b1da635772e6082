#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <numeric>
#include <span>
#include <vector>

#include "archive/Format.hpp"
#include "packing/ByteCursor.hpp"

// The stored forms of canonical Huffman codes. Only code lengths are stored:
// shorter codes come first, codes of one length are consecutive numbers in
// the order of their symbols, and the first code is all zeros.
//
// `unpack` is for outside bytes: it throws DamagedFormException unless the
// code is complete, so that any bits afterwards lead to some symbol.
namespace tessel::archive {

// Code lengths of the symbols of a fixed alphabet of at most 256.
//
//   | first | last | (last - first) / 2 + 1 bytes, if first < last |
//
// Lengths are stored in four bits each, the low half of a byte first.
struct LengthTable {
    unsigned first = 1;
    unsigned last = 0;
    std::array<std::uint8_t, 256> lengths{};  // 0: no code, or the only symbol

    bool empty() const noexcept { return first > last; }
    // The only symbol takes no bits.
    bool single() const noexcept { return first == last; }

    void pack(std::vector<std::uint8_t>& out) const;
    static LengthTable unpack(sixpacks::ByteCursor& cursor, unsigned alphabet,
                              unsigned maxBits);
};

// How many symbols have a code of each length; their order is stored
// elsewhere. There is at least one symbol.
//
//   | greatest length | varint per length from 1 |
//
// A greatest length of 0 is a single symbol, which takes no bits.
struct CountTable {
    unsigned maxLength = 0;
    std::array<std::uint32_t, maxTokenCodeBits + 1> counts{};  // [length]

    std::uint64_t symbols() const noexcept {
        if (maxLength == 0) return 1;
        return std::accumulate(counts.begin(), counts.end(), std::uint64_t{0});
    }

    // The table of these code lengths, in any order.
    static CountTable of(std::span<const std::uint8_t> lengths);

    void pack(std::vector<std::uint8_t>& out) const;
    static CountTable unpack(sixpacks::ByteCursor& cursor);
};

// Seven bits per byte, lowest first; the high bit says that more follow.
void packVarint(std::uint32_t value, std::vector<std::uint8_t>& out);
std::uint32_t unpackVarint(sixpacks::ByteCursor& cursor);

}  // namespace tessel::archive
