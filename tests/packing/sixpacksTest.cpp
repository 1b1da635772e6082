// Unsigned integers at four widths, and counted lists of them.

#include <gtest/gtest.h>

#include <type_traits>

#include "packing/sixpacks.hpp"
#include "tests/support/Bytes.hpp"

namespace {

using namespace tessel::sixpacks;
using support::Bytes;
using tessel::DamagedFormException;
using Sizes = std::vector<std::size_t>;

constexpr PackedSizeT widths[] = {PackedSizeT::Uint8, PackedSizeT::Uint16,
                                  PackedSizeT::Uint32, PackedSizeT::Uint64};

PackedSizeT unknownWidth(unsigned code) {
    return static_cast<PackedSizeT>(code);
}

Bytes packed(std::size_t value, PackedSizeT width) {
    Bytes out;
    makePackerUnpacker(width)->packValue(value, out);
    return out;
}

// ---- Widths ----

struct Choice {
    std::size_t value;
    PackedSizeT width;
    std::uint8_t code;
};

TEST(PackedIntegers, TheNarrowestWidthThatHoldsTheValueIsChosen) {
    const Choice choices[] = {
        {0, PackedSizeT::Uint8, 0x00},
        {255, PackedSizeT::Uint8, 0x00},
        {256, PackedSizeT::Uint16, 0x01},
        {65535, PackedSizeT::Uint16, 0x01},
        {65536, PackedSizeT::Uint32, 0x02},
        {4294967295, PackedSizeT::Uint32, 0x02},
        {4294967296, PackedSizeT::Uint64, 0x03},
        {~std::size_t{0}, PackedSizeT::Uint64, 0x03},
    };
    for (const Choice& choice : choices) {
        Bytes out = {0xEE};
        EXPECT_EQ(packPackedSizeT(choice.value, out), choice.width)
            << choice.value;
        EXPECT_EQ(out, (Bytes{0xEE, choice.code})) << choice.value;
        EXPECT_EQ(narrowestWidth(choice.value), choice.width);
    }
}

TEST(PackedIntegers, TheWidthsTakeOneTwoFourAndEightBytes) {
    EXPECT_EQ(widthBytes(PackedSizeT::Uint8), 1U);
    EXPECT_EQ(widthBytes(PackedSizeT::Uint16), 2U);
    EXPECT_EQ(widthBytes(PackedSizeT::Uint32), 4U);
    EXPECT_EQ(widthBytes(PackedSizeT::Uint64), 8U);
    EXPECT_EQ(sizeof(PackedSizeT), 1U);
}

TEST(PackedIntegers, EveryUnknownWidthIsRefused) {
    for (unsigned code = 4; code < 256; ++code) {
        const PackedSizeT width = unknownWidth(code);
        EXPECT_THROW(makePackerUnpacker(width), InvalidUintConversionException);
        EXPECT_THROW(widthBytes(width), InvalidUintConversionException);
    }
}

TEST(PackedIntegers, TheExceptionIsReachableUnderBothNames) {
    EXPECT_TRUE((std::is_same_v<tessel::InvalidUintConversionException,
                                InvalidUintConversionException>));
    EXPECT_STREQ(InvalidUintConversionException().what(),
                 "Invalid uint type conversion.");
    EXPECT_TRUE((std::is_convertible_v<InvalidUintConversionException*,
                                       std::exception*>));
}

// ---- Single values ----

TEST(PackedIntegers, ValuesAreLittleEndian) {
    EXPECT_EQ(packed(0x0102, PackedSizeT::Uint16), (Bytes{0x02, 0x01}));
    EXPECT_EQ(packed(0x0102, PackedSizeT::Uint32),
              (Bytes{0x02, 0x01, 0x00, 0x00}));
    EXPECT_EQ(packed(0x0102030405060708, PackedSizeT::Uint64),
              (Bytes{8, 7, 6, 5, 4, 3, 2, 1}));
}

TEST(PackedIntegers, OneFunctionPacksAtAnyWidth) {
    for (const PackedSizeT width : widths)
        for (const std::uint64_t value : {0x0102030405060708ULL, 0xFFULL}) {
            Bytes out = {0xEE};
            packUint(value, width, out);
            EXPECT_EQ(out, support::join({{0xEE}, packed(value, width)}));
        }
    Bytes out;
    EXPECT_THROW(packUint(1, unknownWidth(4), out),
                 InvalidUintConversionException);
    EXPECT_TRUE(out.empty());
}

TEST(PackedIntegers, AValueThatDoesNotFitLosesItsHighBytes) {
    EXPECT_EQ(packed(300, PackedSizeT::Uint8), Bytes{0x2C});
    EXPECT_EQ(packed(0x12345678, PackedSizeT::Uint16), (Bytes{0x78, 0x56}));
}

TEST(PackedIntegers, WhatWasPackedIsUnpackedAtEachWidth) {
    const std::size_t largest[] = {0xFF, 0xFFFF, 0xFFFFFFFF, ~std::size_t{0}};
    for (std::size_t w = 0; w < 4; ++w) {
        for (const std::size_t value :
             {std::size_t{0}, std::size_t{0x80}, largest[w], largest[w] / 3}) {
            const Bytes bytes = packed(value, widths[w]);
            EXPECT_EQ(bytes.size(), widthBytes(widths[w]));
            auto it = bytes.begin();
            std::size_t back = 99;
            makePackerUnpacker(widths[w])->unpackValue(back, it);
            EXPECT_EQ(back, value);
            EXPECT_EQ(it, bytes.end());
            ByteCursor cursor(bytes);
            EXPECT_EQ(cursor.takeUint(widths[w]), value);
            EXPECT_TRUE(cursor.empty());
        }
    }
}

TEST(PackedIntegers, ManyValuesAreAppendedInOrder) {
    const auto packer = makePackerUnpacker(PackedSizeT::Uint16);
    Bytes out = {0xEE};
    packer->packValues({1, 0x203}, out);
    EXPECT_EQ(out, (Bytes{0xEE, 1, 0, 3, 2}));
    Sizes values = {9};
    auto it = out.cbegin() + 1;
    packer->unpackValues(values, it, 2);
    EXPECT_EQ(values, (Sizes{9, 1, 0x203}));
    EXPECT_EQ(it, out.cend());
    packer->unpackValues(values, it, 0);
    EXPECT_EQ(values.size(), 3U);
}

// ---- Counted lists ----

TEST(PackedIntegers, AnEmptyListIsItsCount) {
    Bytes out;
    packSizeTVector({}, out, PackedSizeT::Uint64, PackedSizeT::Uint32);
    EXPECT_EQ(out, (Bytes{0, 0, 0, 0}));
    Sizes values = {7};
    auto it = out.cbegin();
    unpackSizeTVector(values, it, PackedSizeT::Uint64, PackedSizeT::Uint32);
    EXPECT_EQ(values, Sizes{7});
    EXPECT_EQ(it, out.cend());
}

TEST(PackedIntegers, TheCountComesBeforeTheValues) {
    Bytes out;
    packSizeTVector({1, 2}, out, PackedSizeT::Uint8, PackedSizeT::Uint16);
    EXPECT_EQ(out, (Bytes{0x02, 0x00, 0x01, 0x02}));
}

TEST(PackedIntegers, UnpackedValuesComeAfterThoseAlreadyThere) {
    const Bytes bytes = {2, 5, 6, 0xEE};
    Sizes values = {1, 2};
    auto it = bytes.begin();
    unpackSizeTVector(values, it, PackedSizeT::Uint8, PackedSizeT::Uint8);
    EXPECT_EQ(values, (Sizes{1, 2, 5, 6}));
    EXPECT_EQ(it, bytes.end() - 1);
    ByteCursor cursor(bytes);
    unpackSizeTVector(values, cursor, PackedSizeT::Uint8, PackedSizeT::Uint8);
    EXPECT_EQ(values, (Sizes{1, 2, 5, 6, 5, 6}));
    EXPECT_EQ(cursor.remaining(), 1U);
}

TEST(PackedIntegers, TheWidthFourIsRefusedEverywhere) {
    const PackedSizeT four = unknownWidth(4);
    const Bytes bytes = {1, 2, 3, 4, 5, 6, 7, 8, 9};
    Bytes out;
    Sizes values;
    auto it = bytes.begin();
    EXPECT_THROW(packSizeTVector({1}, out, PackedSizeT::Uint8, four),
                 InvalidUintConversionException);
    EXPECT_TRUE(out.empty());
    EXPECT_THROW(unpackSizeTVector(values, it, PackedSizeT::Uint8, four),
                 InvalidUintConversionException);
    EXPECT_EQ(it, bytes.begin());
    ByteCursor cursor(bytes);
    EXPECT_THROW(unpackSizeTVector(values, cursor, PackedSizeT::Uint8, four),
                 InvalidUintConversionException);
    EXPECT_EQ(cursor.remaining(), bytes.size());
}

TEST(PackedIntegers, ABadWidthOfTheValuesIsSeenAfterTheCount) {
    const PackedSizeT four = unknownWidth(4);
    const Bytes bytes = {0, 0, 9};
    Bytes out;
    Sizes values;
    auto it = bytes.begin();
    EXPECT_THROW(packSizeTVector({}, out, four, PackedSizeT::Uint16),
                 InvalidUintConversionException);
    EXPECT_EQ(out, (Bytes{0, 0}));
    EXPECT_THROW(unpackSizeTVector(values, it, four, PackedSizeT::Uint16),
                 InvalidUintConversionException);
    EXPECT_EQ(it, bytes.begin() + 2);
    ByteCursor cursor(bytes);
    EXPECT_THROW(unpackSizeTVector(values, cursor, four, PackedSizeT::Uint16),
                 InvalidUintConversionException);
    EXPECT_TRUE(values.empty());
}

TEST(PackedIntegers, ListsOfValuesAreCheckedBeforeAnythingIsAppended) {
    Sizes values = {1};
    const Bytes cut = {3, 0, 1, 0, 2, 0};  // claims three of two bytes
    ByteCursor cursor(cut);
    EXPECT_THROW(unpackSizeTVector(values, cursor, PackedSizeT::Uint16,
                                   PackedSizeT::Uint16),
                 DamagedFormException);
    const Bytes huge(8, 0xFF);
    cursor = ByteCursor(huge);
    EXPECT_THROW(unpackSizeTVector(values, cursor, PackedSizeT::Uint64,
                                   PackedSizeT::Uint64),
                 DamagedFormException);
    EXPECT_EQ(values, Sizes{1});
}

}  // namespace
