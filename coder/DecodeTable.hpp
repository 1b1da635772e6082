#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "coder/HNode.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

// What the next bits decode to, several characters at a step, derived from a
// Huffman tree. It gives exactly what walking the tree bit by bit gives and
// leaves to that walk whatever it does not hold: codes longer than
// `windowBits` and bits that lead off the tree.
//
// Cost: 8 KiB.
class DecodeTable {
public:
    static constexpr unsigned windowBits = 10;
    static constexpr unsigned mostCharacters = 3;

    struct Step {
        std::array<char16_t, mostCharacters> characters{};
        std::uint16_t count : 4 = 0;  // of characters; 0: ask the tree
        // Bits that the first one, two and three characters take. What
        // fewer than three characters leave free repeats the last.
        std::uint16_t bits1 : 4 = 0;
        std::uint16_t bits2 : 4 = 0;
        std::uint16_t bits3 : 4 = 0;

        unsigned bits(unsigned characterCount) const noexcept {
            return characterCount == count ? bits3
                   : characterCount == 2   ? bits2
                                           : bits1;
        }
    };

    // Derives the table; an empty tree or one whose root is a leaf gives an
    // empty table.
    void build(const std::vector<HNode>& nodes, std::int32_t rootIndex);

    void clear() noexcept { releaseContents(steps); }
    bool empty() const noexcept { return steps.empty(); }

    // The step for the next windowBits bits, the first one least significant.
    const Step& operator[](std::uint64_t window) const noexcept {
        return steps[window & ((1U << windowBits) - 1)];
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return steps.capacity() * sizeof(Step);
    }

private:
    std::vector<Step> steps;
};

}  // namespace tessel
