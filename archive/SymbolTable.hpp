#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "packing/ByteCursor.hpp"

namespace tessel::archive {

// Code lengths of a fixed alphabet, as a length table stores them.
struct CodeLengths {
    unsigned first = 1;                 // the lowest symbol with a code
    std::vector<std::uint8_t> lengths;  // from `first` on; 0: no code

    // Reads one length table and advances past it. Throws DamagedFormException
    // unless the lengths are those of a complete code, of a single symbol or
    // of none, all at most maxBits and for symbols below symbolCount.
    static CodeLengths unpack(sixpacks::ByteCursor& cursor,
                              unsigned symbolCount, unsigned maxBits);
};

// A canonical Huffman code of at most maxBits per symbol, decoded by one
// lookup.
//
// Threads: const members from any number of threads.
// Cost: 2^(maxBits + 1) bytes.
template <unsigned maxBits>
class SymbolTable {
public:
    // Larger than any symbol: what every lookup finds if no symbol has a code.
    static constexpr unsigned noSymbol = 0xFFF;

    struct Decoded {
        unsigned symbol;
        unsigned bits;  // of its code
    };

    SymbolTable() noexcept { table_.fill(packed(noSymbol, 0)); }
    explicit SymbolTable(const CodeLengths& code);

    // The symbol whose code is at the top of the word.
    Decoded decode(std::uint64_t word) const noexcept {
        const std::uint16_t entry = table_[word >> (64 - maxBits)];
        return {entry >> 4U, entry & 15U};
    }

private:
    static_assert(maxBits < 16);
    static std::uint16_t packed(unsigned symbol, unsigned bits) noexcept {
        return static_cast<std::uint16_t>(symbol << 4U | bits);
    }

    std::array<std::uint16_t, std::size_t{1} << maxBits> table_;
};

template <unsigned maxBits>
SymbolTable<maxBits>::SymbolTable(const CodeLengths& code) : SymbolTable() {
    if (code.lengths.size() == 1) table_.fill(packed(code.first, 0));
    auto next = table_.begin();
    for (unsigned bits = 1; bits <= maxBits; ++bits)
        for (unsigned i = 0; i < code.lengths.size(); ++i)
            if (code.lengths[i] == bits)
                next = std::fill_n(next, std::size_t{1} << (maxBits - bits),
                                   packed(code.first + i, bits));
}

}  // namespace tessel::archive
