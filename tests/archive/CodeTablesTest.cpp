#include <gtest/gtest.h>

#include "archive/CodeTables.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

LengthTable unpackedLengths(const Bytes& bytes, unsigned maxBits = 10) {
    sixpacks::ByteCursor cursor(bytes);
    const auto table = LengthTable::unpack(cursor, 128, maxBits);
    EXPECT_TRUE(cursor.empty());
    return table;
}

CountTable unpackedCounts(const Bytes& bytes) {
    sixpacks::ByteCursor cursor(bytes);
    const auto table = CountTable::unpack(cursor);
    EXPECT_TRUE(cursor.empty());
    return table;
}

TEST(CodeTablesTest, LengthsComeBack) {
    LengthTable table;
    table.first = 3;
    table.last = 6;
    table.lengths[3] = 1;
    table.lengths[5] = 2;
    table.lengths[6] = 2;
    Bytes bytes;
    table.pack(bytes);
    EXPECT_EQ(bytes, (Bytes{3, 6, 0x01, 0x22}));
    EXPECT_EQ(unpackedLengths(bytes).lengths, table.lengths);
}

TEST(CodeTablesTest, AnOddNumberOfLengthsEndsWithHalfAByte) {
    LengthTable table;
    table.first = 0;
    table.last = 2;
    table.lengths = {2, 1, 2};
    Bytes bytes;
    table.pack(bytes);
    EXPECT_EQ(bytes, (Bytes{0, 2, 0x12, 0x02}));
    EXPECT_EQ(unpackedLengths(bytes).lengths, table.lengths);
}

TEST(CodeTablesTest, OneSymbolAndNoneTakeTwoBytes) {
    EXPECT_TRUE(unpackedLengths({7, 7}).single());
    EXPECT_EQ(unpackedLengths({7, 7}).first, 7U);
    EXPECT_TRUE(unpackedLengths({1, 0}).empty());
    Bytes bytes;
    LengthTable().pack(bytes);
    EXPECT_EQ(bytes, (Bytes{1, 0}));
}

TEST(CodeTablesTest, BadLengthsAreDamaged) {
    for (const Bytes& bytes : {
             Bytes{},               // nothing
             Bytes{3},              // no last symbol
             Bytes{3, 6, 0x01},     // too few lengths
             Bytes{3, 200, 0x11},   // a symbol outside the alphabet
             Bytes{200, 200},       // the same
             Bytes{3, 4, 0x01},     // half a code
             Bytes{3, 5, 0x11, 1},  // three codes of one bit
             Bytes{3, 4, 0xBB},     // longer than allowed
             Bytes{3, 4, 0x00},     // no code at all
         })
        EXPECT_THROW(unpackedLengths(bytes), DamagedFormException);
}

TEST(CodeTablesTest, CountsComeBack) {
    const std::vector<std::uint8_t> lengths = {3, 1, 2, 3};
    const CountTable table = CountTable::of(lengths);
    EXPECT_EQ(table.symbols(), 4U);
    Bytes bytes;
    table.pack(bytes);
    EXPECT_EQ(bytes, (Bytes{3, 1, 1, 2}));
    EXPECT_EQ(unpackedCounts(bytes).counts, table.counts);
}

TEST(CodeTablesTest, OneSymbolHasNoLength) {
    const std::vector<std::uint8_t> lengths = {0};
    Bytes bytes;
    CountTable::of(lengths).pack(bytes);
    EXPECT_EQ(bytes, Bytes{0});
    EXPECT_EQ(unpackedCounts(bytes).symbols(), 1U);
}

TEST(CodeTablesTest, BadCountsAreDamaged) {
    for (const Bytes& bytes : {
             Bytes{},         // nothing
             Bytes{25},       // longer than allowed
             Bytes{2, 1},     // too few counts
             Bytes{1, 1},     // half a code
             Bytes{1, 3},     // three codes of one bit
             Bytes{2, 2, 0},  // the last length is not used
             Bytes{1, 0x82, 0x80, 0x80, 0x80, 0x80, 0x00},  // six bytes
             Bytes{1, 0xFF, 0xFF, 0xFF, 0xFF, 0x7F},        // above 32 bits
         })
        EXPECT_THROW(unpackedCounts(bytes), DamagedFormException);
}

TEST(CodeTablesTest, VarintsComeBack) {
    for (const std::uint32_t value :
         {0U, 1U, 127U, 128U, 16383U, 16384U, 0x7FFFFFFFU, 0xFFFFFFFFU}) {
        Bytes bytes;
        packVarint(value, bytes);
        sixpacks::ByteCursor cursor(bytes);
        EXPECT_EQ(unpackVarint(cursor), value);
        EXPECT_TRUE(cursor.empty());
    }
    Bytes bytes;
    packVarint(300, bytes);
    EXPECT_EQ(bytes, (Bytes{0xAC, 0x02}));
}

TEST(CodeTablesTest, AVarintHasAtMost32BitsInFiveBytes) {
    for (const Bytes& bytes :
         {Bytes{}, Bytes{0x80}, Bytes{0xFF, 0xFF, 0xFF, 0xFF, 0x10},
          Bytes{0x80, 0x80, 0x80, 0x80, 0x80, 0x00}}) {
        sixpacks::ByteCursor cursor(bytes);
        EXPECT_THROW(unpackVarint(cursor), DamagedFormException);
    }
}

}  // namespace
}  // namespace tessel::archive
