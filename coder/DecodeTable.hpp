#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "coder/HNode.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

// What the next bits decode to, several characters at a step, derived from a
// Huffman tree. It gives exactly what walking the tree bit by bit gives and
// leaves to that walk whatever it does not hold: codes longer than
// `windowBits` and bits that lead off the tree.
//
// Cost: 16 KiB.
class DecodeTable {
public:
    static constexpr unsigned windowBits = 11;
    static constexpr unsigned mostCharacters = 3;

    // Up to three characters and the bits that they take, in one word: the
    // characters from the lowest bits up, their count, and the bits that the
    // first one, two and three take. What fewer characters leave free repeats
    // the last, so the bits of three are those of all.
    class Step {
    public:
        // Characters that a step is written as, with or without a meaning.
        static constexpr unsigned writtenCharacters = 4;

        // 0: nothing is known, ask the tree.
        unsigned count() const noexcept { return field(0); }
        // Bits that all of its characters take.
        unsigned bits() const noexcept { return field(mostCharacters); }
        // Bits that the first n take, n from 1 to count().
        unsigned bitsOf(unsigned n) const noexcept { return field(n); }

        // How many of its characters end within so many bits.
        unsigned countWithin(std::uint64_t bitCount) const noexcept {
            unsigned n = count();
            while (n > 0 && bitsOf(n) > bitCount) --n;
            return n;
        }

        // Writes its characters and, behind them, what is to be overwritten.
        void writeTo(char16_t* out) const noexcept {
            static_assert(std::endian::native == std::endian::little);
            static_assert(sizeof word_ == writtenCharacters * sizeof *out);
            std::memcpy(out, &word_, sizeof word_);
        }

        // Appends a character that ends after so many bits of the window;
        // there must be fewer than mostCharacters.
        void append(char16_t character, unsigned bitCount) noexcept;

    private:
        static constexpr unsigned characterBits = 16;
        static constexpr unsigned fieldBits = 4;
        static constexpr unsigned fieldsAt = mostCharacters * characterBits;
        static constexpr std::uint64_t fieldMask = (1U << fieldBits) - 1;
        static_assert(windowBits < 1U << fieldBits);

        unsigned field(unsigned i) const noexcept {
            return static_cast<unsigned>((word_ >> (fieldsAt + i * fieldBits)) &
                                         fieldMask);
        }

        std::uint64_t word_ = 0;
    };

    // Derives the table; an empty tree or one whose root is a leaf gives an
    // empty table.
    void build(const std::vector<HNode>& nodes, std::int32_t rootIndex);

    void clear() noexcept { releaseContents(steps_); }
    bool empty() const noexcept { return steps_.empty(); }

    // The step for the next windowBits bits, the first one least significant.
    Step operator[](std::uint64_t window) const noexcept {
        return steps_[window & ((1U << windowBits) - 1)];
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return steps_.capacity() * sizeof(Step);
    }

private:
    std::vector<Step> steps_;
};

}  // namespace tessel
