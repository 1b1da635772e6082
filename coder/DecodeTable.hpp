#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "coder/HNode.hpp"

namespace tessel {

// Maps the next `windowBits` bits to the characters that they begin with,
// several per entry, derived from a Huffman tree. Decoding by the table gives
// exactly what walking the tree bit by bit gives; codes longer than a window
// and bits that lead off the tree are left to that walk.
//
// Ownership: a value; copies are independent.
// Threads: any number of readers while nobody builds.
// Cost: 16 KiB.
class DecodeTable {
public:
    // Chosen so that the table stays within half of a 32 KiB first-level
    // cache; 12 bits would fill all of it.
    static constexpr unsigned windowBits = 11;
    // As many as share eight bytes with the lengths of their codes.
    static constexpr unsigned maxCharacters = 3;

    // Up to three characters and their code lengths, in one 8-byte word, the
    // lowest bits first:
    //
    //   | 3 characters, 16 bits each | count, 4 | end of 1, of 2, of 3: 4 each
    //   |
    //
    // "End of n" is the number of bits that the first n characters take. If
    // an entry has fewer than three, the last end is repeated, so "end of 3"
    // is always the total. A word and not a struct: so it stays in one
    // register, which takes 8 % off the instructions of decoding.
    class Entry {
    public:
        // Number of code units that a whole entry overlays.
        static constexpr unsigned writtenUnits = 4;

        // 0: nothing is known; walk the tree.
        unsigned count() const noexcept { return field(0); }
        // Bits that all its characters take.
        unsigned bitLength() const noexcept { return field(maxCharacters); }
        // Bits that the first n characters take, n from 1 to count().
        unsigned bitLengthOf(unsigned n) const noexcept { return field(n); }

        // How many of its characters end within this many bits.
        unsigned charactersWithin(std::uint64_t bitCount) const noexcept {
            unsigned n = count();
            while (n > 0 && bitLengthOf(n) > bitCount) --n;
            return n;
        }

        // Writes writtenUnits code units: its count() characters and then
        // garbage, which the next write must cover.
        void writeTo(char16_t* out) const noexcept {
            static_assert(std::endian::native == std::endian::little);
            static_assert(sizeof word_ == writtenUnits * sizeof *out);
            std::memcpy(out, &word_, sizeof word_);
        }

        // Appends a character whose code ends after this many bits of the
        // window. There must be fewer than maxCharacters.
        void append(char16_t character, unsigned bitCount) noexcept;

    private:
        static constexpr unsigned characterBits = 16;
        static constexpr unsigned fieldBits = 4;
        static constexpr unsigned fieldsAt = maxCharacters * characterBits;
        static constexpr std::uint64_t fieldMask = (1U << fieldBits) - 1;
        static_assert(windowBits <= fieldMask);

        unsigned field(unsigned i) const noexcept {
            return static_cast<unsigned>((word_ >> (fieldsAt + i * fieldBits)) &
                                         fieldMask);
        }

        std::uint64_t word_ = 0;
    };

    // Derives the table; an empty tree or one whose root is a leaf gives an
    // empty table. If it throws (std::bad_alloc), the table is empty.
    void build(const std::vector<HNode>& nodes, std::int32_t rootIndex);

    void clear() noexcept;
    bool empty() const noexcept { return entries_.empty(); }

    // The entry for the next windowBits bits, the first one least significant.
    Entry operator[](std::uint64_t window) const noexcept {
        return entries_[window & ((1U << windowBits) - 1)];
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return entries_.capacity() * sizeof(Entry);
    }

private:
    std::vector<Entry> entries_;
};

}  // namespace tessel
