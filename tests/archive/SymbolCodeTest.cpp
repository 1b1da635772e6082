#include <gtest/gtest.h>

#include "archive/SymbolCode.hpp"

namespace tessel::archive {
namespace {

TEST(SymbolCodeTest, PutsTheCanonicalCodes) {
    const std::vector<std::uint64_t> counts = {0, 8, 0, 2, 1, 1};
    const SymbolCode code(counts, 10);
    EXPECT_EQ(code.table().first, 1U);
    EXPECT_EQ(code.table().last, 5U);
    BitWriter out;
    for (const unsigned symbol : {1U, 3U, 4U, 5U}) code.put(out, symbol);
    // 0, 10, 110, 111
    EXPECT_EQ(out.take(), (std::vector<std::uint8_t>{0b01011011, 0b10000000}));
}

TEST(SymbolCodeTest, TheOnlySymbolTakesNoBits) {
    const std::vector<std::uint64_t> counts = {0, 0, 9};
    const SymbolCode code(counts, 10);
    EXPECT_TRUE(code.table().single());
    EXPECT_EQ(code.table().first, 2U);
    BitWriter out;
    code.put(out, 2);
    EXPECT_TRUE(out.take().empty());
}

TEST(SymbolCodeTest, NoSymbolIsAnEmptyTable) {
    EXPECT_TRUE(SymbolCode().table().empty());
    const std::vector<std::uint64_t> counts(256);
    EXPECT_TRUE(SymbolCode(counts, 8).table().empty());
}

}  // namespace
}  // namespace tessel::archive
