#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>

#include "archive/CodeTables.hpp"

namespace tessel::archive {

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
    // The code must be complete, of a single symbol, or empty, with lengths of
    // at most maxBits.
    explicit SymbolTable(const LengthTable& code);

    // The symbol whose code is at the top of the word.
    Decoded decode(std::uint64_t word) const noexcept {
        const std::uint16_t entry = table_[word >> (64 - maxBits)];
        return {std::uint32_t{entry} >> 4U, entry & 15U};
    }

private:
    static_assert(maxBits < 16);
    static std::uint16_t packed(unsigned symbol, unsigned bits) noexcept {
        return static_cast<std::uint16_t>(symbol << 4U | bits);
    }

    std::array<std::uint16_t, std::size_t{1} << maxBits> table_;
};

template <unsigned maxBits>
SymbolTable<maxBits>::SymbolTable(const LengthTable& code) : SymbolTable() {
    if (code.single()) table_.fill(packed(code.first, 0));
    if (code.first >= code.last) return;
    auto next = table_.begin();
    for (unsigned bits = 1; bits <= maxBits; ++bits)
        for (unsigned symbol = code.first; symbol <= code.last; ++symbol)
            if (code.lengths[symbol] == bits)
                next = std::fill_n(next, std::size_t{1} << (maxBits - bits),
                                   packed(symbol, bits));
}

}  // namespace tessel::archive
