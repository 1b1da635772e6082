#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace tessel {

// The code of every character, for encoding: from a code unit to the bits of
// its code, nearest the root first, and to its leaf in the Huffman tree.
//
// A code of at most `longestInline` bits is in the table itself. For a longer
// code the table holds only the leaf, and the bits are read from the tree: so
// a tree as deep as it has leaves costs no more than any other.
//
// Ownership: a value; copies are independent.
// Threads: any number of readers while nobody inserts.
// Cost: 16 bytes per code unit, for each block of 256 units in use.
class CodeTable {
public:
    // A bit writer that holds up to 7 bits takes this many more in 64.
    static constexpr unsigned longestInline = 56;

    struct Entry {
        std::uint64_t bits = 0;   // bit i of the code is bit i here
        std::int32_t leaf = -1;   // position of the leaf; -1: no code
        std::uint8_t length = 0;  // in bits, up to longestInline
        bool isLong = false;      // bits and length are not given

        bool exists() const noexcept { return leaf != -1; }
    };

    const Entry& operator[](char16_t character) const noexcept {
        return entries_[pageStart_[character >> 8] + (character & 0xFFU)];
    }

    // Adds the entry unless the character has one already. Throws
    // std::invalid_argument if the code is longer than longestInline or has
    // bits after its length, unless it is long. If it throws (std::bad_alloc,
    // too), nothing changes.
    void insert(char16_t character, const Entry& entry);

    // Removes every code; keeps the memory.
    void clear() noexcept;

    // Number of characters that have a code.
    std::size_t size() const noexcept { return count_; }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return pageStart_.capacity() * sizeof(std::uint32_t) +
               entries_.capacity() * sizeof(Entry);
    }

private:
    static constexpr std::size_t pageEntries = 256;

    // Page 0 holds no codes; every block of units without codes uses it.
    std::vector<std::uint32_t> pageStart_ =
        std::vector<std::uint32_t>(pageEntries, 0);
    std::vector<Entry> entries_ = std::vector<Entry>(pageEntries);
    std::size_t count_ = 0;
};

}  // namespace tessel
