#include <gtest/gtest.h>

#include <cstdint>

#include "archive/SymbolTable.hpp"

namespace tessel::archive {
namespace {

using Table = SymbolTable<8>;

// Symbols 3, 4, 5 and 7 with code lengths 2, 1, 3 and 3.
LengthTable fourSymbols() {
    LengthTable code;
    code.first = 3;
    code.last = 7;
    code.lengths[3] = 2;
    code.lengths[4] = 1;
    code.lengths[5] = 3;
    code.lengths[7] = 3;
    return code;
}

// The symbol of a code word, which is followed by ones.
unsigned symbolOf(const Table& table, std::uint64_t code, unsigned bits) {
    const std::uint64_t word = code << (64 - bits) | ~std::uint64_t{0} >> bits;
    const auto decoded = table.decode(word);
    EXPECT_EQ(decoded.bits, bits);
    return decoded.symbol;
}

TEST(SymbolTable, DecodesCanonicalCodes) {
    const Table table(fourSymbols());
    EXPECT_EQ(symbolOf(table, 0b0, 1), 4U);
    EXPECT_EQ(symbolOf(table, 0b10, 2), 3U);
    EXPECT_EQ(symbolOf(table, 0b110, 3), 5U);
    EXPECT_EQ(symbolOf(table, 0b111, 3), 7U);
}

TEST(SymbolTable, ASingleSymbolTakesNoBits) {
    LengthTable code;
    code.first = code.last = 200;
    const Table table(code);
    for (const std::uint64_t word : {std::uint64_t{0}, ~std::uint64_t{0}}) {
        EXPECT_EQ(table.decode(word).symbol, 200U);
        EXPECT_EQ(table.decode(word).bits, 0U);
    }
}

TEST(SymbolTable, WithoutSymbolsThereIsNone) {
    EXPECT_EQ(Table(LengthTable()).decode(0).symbol, Table::noSymbol);
    EXPECT_EQ(Table().decode(~std::uint64_t{0}).symbol, Table::noSymbol);
}

}  // namespace
}  // namespace tessel::archive
