// The table from characters to codes.

#include <gtest/gtest.h>

#include "coder/CodeTable.hpp"

namespace {

using tessel::CodeTable;

CodeTable::Entry entry(std::uint64_t bits, std::uint8_t length) {
    return {bits, 7, length, false};
}

TEST(CodeTable, ACharacterThatWasNotInsertedHasNoCode) {
    CodeTable codes;
    codes.insert(u'b', entry(5, 3));
    EXPECT_EQ(codes.size(), 1U);
    for (unsigned unit = 0; unit < 0x10000; ++unit)
        EXPECT_EQ(codes[static_cast<char16_t>(unit)].exists(), unit == u'b');
}

TEST(CodeTable, TheFirstCodeOfACharacterStays) {
    CodeTable codes;
    codes.insert(u'b', entry(5, 3));
    codes.insert(u'b', entry(6, 4));
    EXPECT_EQ(codes[u'b'].bits, 5U);
    EXPECT_EQ(codes[u'b'].length, 3U);
    EXPECT_EQ(codes.size(), 1U);
}

TEST(CodeTable, EveryCodeUnitHasAPlaceOfItsOwn) {
    CodeTable codes;
    for (unsigned unit = 0; unit < 0x10000; unit += 255)
        codes.insert(static_cast<char16_t>(unit), entry(unit, 16));
    for (unsigned unit = 0; unit < 0x10000; unit += 255)
        EXPECT_EQ(codes[static_cast<char16_t>(unit)].bits, unit);
    EXPECT_EQ(codes.size(), 258U);
}

TEST(CodeTable, ACopyIsIndependentAndClearingTakesEveryCodeAway) {
    CodeTable codes;
    codes.insert(u'b', entry(5, 3));
    codes.insert(u'\x161', entry(1, 1));
    const CodeTable copy = codes;
    codes.clear();
    EXPECT_EQ(codes.size(), 0U);
    EXPECT_FALSE(codes[u'b'].exists());
    EXPECT_FALSE(codes[u'\x161'].exists());
    EXPECT_EQ(copy[u'\x161'].bits, 1U);
    codes.insert(u'\x161', entry(0, 2));
    EXPECT_EQ(codes[u'\x161'].length, 2U);
    EXPECT_FALSE(codes[u'b'].exists());
}

}  // namespace
