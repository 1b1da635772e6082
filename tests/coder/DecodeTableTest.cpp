// The table from the next bits to characters.

#include <gtest/gtest.h>

#include <array>

#include "coder/DecodeTable.hpp"

namespace {

using tessel::DecodeTable;
using tessel::HNode;

HNode leaf(std::int32_t index, char16_t character) {
    return {0, character, index, -1, -1};
}

// a = 0, b = 10, c = 11.
std::vector<HNode> threeLeaves() {
    return {{0, 0, 0, 1, 2},
            leaf(1, u'a'),
            {0, 0, 2, 3, 4},
            leaf(3, u'b'),
            leaf(4, u'c')};
}

std::u16string textOf(DecodeTable::Entry entry) {
    std::array<char16_t, DecodeTable::Entry::writtenUnits> units{};
    entry.writeTo(units.data());
    return {units.data(), entry.count()};
}

TEST(DecodeTable, AnEntryHoldsThreeCharactersAndWhereEachEnds) {
    DecodeTable table;
    table.build(threeLeaves(), 0);
    // From the lowest bit up: 10 11 0.
    const DecodeTable::Entry entry = table[0b01101];
    EXPECT_EQ(textOf(entry), u"bca");
    EXPECT_EQ(entry.bitLengthOf(1), 2U);
    EXPECT_EQ(entry.bitLengthOf(2), 4U);
    EXPECT_EQ(entry.bitLengthOf(3), 5U);
    EXPECT_EQ(entry.bitLength(), 5U);
    EXPECT_EQ(entry.charactersWithin(1), 0U);
    EXPECT_EQ(entry.charactersWithin(4), 2U);
    EXPECT_EQ(entry.charactersWithin(100), 3U);
}

TEST(DecodeTable, BitsAboveTheWindowDoNotMatter) {
    DecodeTable table;
    table.build(threeLeaves(), 0);
    EXPECT_EQ(textOf(table[~std::uint64_t{0}]), u"ccc");
    EXPECT_EQ(textOf(table[0b01101 | std::uint64_t{7} << 60]), u"bca");
}

// A chain: the character at depth d has d - 1 set bits and a clear one.
std::vector<HNode> chain(std::int32_t leaves) {
    std::vector<HNode> nodes;
    for (std::int32_t i = 0; i + 1 < leaves; ++i) {
        nodes.push_back({0, 0, 2 * i, 2 * i + 1, 2 * i + 2});
        nodes.push_back(leaf(2 * i + 1, static_cast<char16_t>(u'a' + i)));
    }
    nodes.push_back(leaf(2 * leaves - 2, u'z'));
    return nodes;
}

TEST(DecodeTable, ACodeLongerThanTheWindowIsNotKnown) {
    constexpr std::int32_t windowBits = DecodeTable::windowBits;
    DecodeTable table;
    table.build(chain(windowBits + 2), 0);
    const std::uint64_t allSet = (1U << windowBits) - 1;
    EXPECT_EQ(table[allSet].count(), 0U);
    EXPECT_EQ(table[allSet].bitLength(), 0U);
    // The longest one that fits ends with the window.
    const DecodeTable::Entry longest = table[allSet >> 1];
    EXPECT_EQ(textOf(longest), std::u16string(1, u'a' + windowBits - 1));
    EXPECT_EQ(longest.bitLength(), DecodeTable::windowBits);
    // With fewer characters than places the last end is repeated.
    EXPECT_EQ(longest.bitLengthOf(3), DecodeTable::windowBits);
}

TEST(DecodeTable, ATreeOfOneLeafOrNoneGivesNoTable) {
    DecodeTable table;
    table.build({}, 0);
    EXPECT_TRUE(table.empty());
    table.build(threeLeaves(), 0);
    EXPECT_FALSE(table.empty());
    EXPECT_EQ(table.memoryBytes(), 16384U);
    table.build({leaf(0, u'a')}, 0);
    EXPECT_TRUE(table.empty());
    EXPECT_EQ(table.memoryBytes(), 0U);
    table.build(threeLeaves(), -1);
    EXPECT_TRUE(table.empty());
    table.build(threeLeaves(), 5);
    EXPECT_TRUE(table.empty());
}

}  // namespace
