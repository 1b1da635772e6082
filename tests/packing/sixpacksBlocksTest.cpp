// Bit blocks, byte blocks and compression.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <zlib.h>

#include <random>
#include <type_traits>

#include "packing/sixpacks.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/ReferenceCode.hpp"

namespace {

using namespace tessel::sixpacks;
using support::Bytes;
using tessel::DamagedFormException;
using Bits = std::vector<bool>;

Bytes blockOf(const Bits& bits) {
    Bytes out;
    boolVecToBytes(out, bits);
    return out;
}

Bits bitsOf(const Bytes& bytes) {
    Bits out;
    bytesToBoolVec(bytes, out);
    return out;
}

// ---- Bit blocks ----

TEST(PackedBlocks, NoBitsAreNoBytes) { EXPECT_EQ(blockOf({}), Bytes()); }

TEST(PackedBlocks, EightBitsAreAFullByteAndAnEmptyOne) {
    EXPECT_EQ(blockOf(Bits(8, true)), (Bytes{0xFF, 0x00, 0x00}));
}

TEST(PackedBlocks, ThreeBitsAreOneByteAndTheirNumber) {
    EXPECT_EQ(blockOf({true, false, true}), (Bytes{0x05, 0x03}));
}

TEST(PackedBlocks, TheNinthBitStartsASecondByte) {
    Bits bits(9, false);
    bits[0] = true;
    EXPECT_EQ(blockOf(bits), (Bytes{0x01, 0x00, 0x01}));
}

TEST(PackedBlocks, BitsAreAppendedToWhatIsThere) {
    Bytes out = {0xEE};
    boolVecToBytes(out, {true});
    EXPECT_EQ(out, (Bytes{0xEE, 0x01, 0x01}));
    Bits bits = {false};
    bytesToBoolVec({0x05, 0x03}, bits);
    EXPECT_EQ(bits, (Bits{false, true, false, true}));
}

TEST(PackedBlocks, ABlockOfThreeBitsIsRead) {
    EXPECT_EQ(bitsOf({0x05, 0x03}), (Bits{true, false, true}));
}

TEST(PackedBlocks, ABlockOfEightBitsIsRead) {
    EXPECT_EQ(bitsOf({0xFF, 0x00, 0x00}), Bits(8, true));
}

TEST(PackedBlocks, ABlockOfOneByteHoldsNoBits) {
    for (unsigned byte = 0; byte < 256; ++byte)
        EXPECT_EQ(bitsOf({static_cast<std::uint8_t>(byte)}), Bits()) << byte;
}

TEST(PackedBlocks, UnusedHighBitsAreIgnored) {
    EXPECT_EQ(bitsOf({0xFD, 0x03}), (Bits{true, false, true}));
}

// No writer makes it, but it says what it means.
TEST(PackedBlocks, ATrailerOfEightTakesTheWholeByte) {
    EXPECT_EQ(bitsOf({0x0F, 0x08}),
              (Bits{true, true, true, true, false, false, false, false}));
    EXPECT_EQ(bitsOf({0x00, 0xFF, 0x08}).size(), 16U);
}

TEST(PackedBlocks, AnEmptyBlockIsRefused) {
    Bits bits = {true};
    EXPECT_THROW(bytesToBoolVec({}, bits), DamagedFormException);
    EXPECT_EQ(bits, Bits{true});
}

TEST(PackedBlocks, MoreBitsThanTheLastByteHasAreRefused) {
    for (unsigned count = 9; count < 256; ++count) {
        Bits bits = {true};
        EXPECT_THROW(
            bytesToBoolVec({0x00, static_cast<std::uint8_t>(count)}, bits),
            DamagedFormException);
        EXPECT_EQ(bits, Bits{true});
    }
}

RC_GTEST_PROP(PackedBlocks, BitsComeBackAndTheBytesAreTheReferences,
              (const Bits& bits)) {
    const Bytes block = blockOf(bits);
    RC_ASSERT(block == model::packBits(bits));
    if (!bits.empty()) RC_ASSERT(bitsOf(block) == bits);
}

// ---- Byte blocks ----

TEST(PackedBlocks, AnEmptyVectorIsItsLength) {
    Bytes data;
    Bytes out;
    packVector(data, out, PackedSizeT::Uint64);
    EXPECT_EQ(out, Bytes(8, 0));
}

TEST(PackedBlocks, TheLengthComesBeforeTheBytes) {
    Bytes data = {7, 8, 9};
    Bytes out = {0xEE};
    packVector(data, out, PackedSizeT::Uint16);
    EXPECT_EQ(out, (Bytes{0xEE, 3, 0, 7, 8, 9}));
    EXPECT_EQ(data, (Bytes{7, 8, 9}));
}

TEST(PackedBlocks, ALengthThatDoesNotFitIsFollowedByEveryByte) {
    Bytes data;
    for (unsigned i = 0; i < 300; ++i)
        data.push_back(static_cast<std::uint8_t>(i * 7));
    Bytes out;
    packVector(data, out, PackedSizeT::Uint8);
    ASSERT_EQ(out.size(), 301U);
    EXPECT_EQ(out[0], 0x2C);
    EXPECT_EQ(Bytes(out.begin() + 1, out.end()), data);
    Bytes back;
    auto it = out.cbegin();
    unpackVector(back, it, PackedSizeT::Uint8);
    EXPECT_EQ(back, Bytes(data.begin(), data.begin() + 44));
    EXPECT_EQ(it - out.cbegin(), 45);
}

TEST(PackedBlocks, ALengthThatDoesNotFitIsCutAndTheRestStaysUnread) {
    Bytes data(300, 0xAB);
    Bytes out;
    packVector(data, out, PackedSizeT::Uint8);
    ASSERT_EQ(out.size(), 301U);
    EXPECT_EQ(out[0], 0x2C);
    Bytes back;
    auto it = out.cbegin();
    unpackVector(back, it, PackedSizeT::Uint8);
    EXPECT_EQ(back, Bytes(44, 0xAB));
    EXPECT_EQ(it - out.cbegin(), 45);
}

TEST(PackedBlocks, UnpackedBytesComeAfterThoseAlreadyThere) {
    const Bytes bytes = {2, 5, 6, 0xEE};
    Bytes back = {1};
    auto it = bytes.begin();
    unpackVector(back, it, PackedSizeT::Uint8);
    EXPECT_EQ(back, (Bytes{1, 5, 6}));
    EXPECT_EQ(it, bytes.end() - 1);
}

TEST(PackedBlocks, AnUnknownWidthIsRefusedBeforeAnythingHappens) {
    const auto four = static_cast<PackedSizeT>(4);
    Bytes data = {1};
    Bytes out;
    auto it = data.cbegin();
    EXPECT_THROW(packVector(data, out, four), InvalidUintConversionException);
    EXPECT_THROW(unpackVector(out, it, four), InvalidUintConversionException);
    ByteCursor cursor(data);
    EXPECT_THROW(unpackVector(cursor, four), InvalidUintConversionException);
    EXPECT_TRUE(out.empty());
    EXPECT_EQ(it, data.cbegin());
    EXPECT_EQ(cursor.remaining(), 1U);
}

TEST(PackedBlocks, ABlockThatIsCutIsRefused) {
    const Bytes bytes = {4, 0, 1, 2, 3};  // claims four, has three
    ByteCursor cursor(bytes);
    EXPECT_THROW(unpackVector(cursor, PackedSizeT::Uint16),
                 DamagedFormException);
    const Bytes noLength = {1};
    cursor = ByteCursor(noLength);
    EXPECT_THROW(unpackVector(cursor, PackedSizeT::Uint16),
                 DamagedFormException);
    const Bytes huge(9, 0xFF);
    cursor = ByteCursor(huge);
    EXPECT_THROW(unpackVector(cursor, PackedSizeT::Uint64),
                 DamagedFormException);
}

TEST(PackedBlocks, ABlockIsReadInPlace) {
    const Bytes bytes = {2, 5, 6, 0xEE};
    ByteCursor cursor(bytes);
    const auto block = unpackVector(cursor, PackedSizeT::Uint8);
    EXPECT_EQ(block.data(), bytes.data() + 1);
    EXPECT_EQ(block.size(), 2U);
    EXPECT_EQ(cursor.takeByte(), 0xEE);
}

// ---- Compression ----

Bytes manyBytes() {
    Bytes data;
    for (unsigned i = 0; i < 5000; ++i)
        data.push_back(static_cast<std::uint8_t>(i * i >> (i % 7)));
    return data;
}

TEST(PackedBlocks, AStreamBeginsWithTheHeaderOfLevelNine) {
    for (Bytes data : {Bytes(), Bytes{1}, Bytes(100000, 7), manyBytes()}) {
        const Bytes stream = compressUint8(data);
        ASSERT_GE(stream.size(), 2U);
        EXPECT_EQ(stream[0], 0x78);
        EXPECT_EQ(stream[1], 0xDA);
    }
}

Bytes zlibStream(const Bytes& data, int level) {
    Bytes stream(compressBound(data.size()));
    uLongf length = stream.size();
    EXPECT_EQ(
        compress2(stream.data(), &length, data.data(), data.size(), level),
        Z_OK);
    stream.resize(length);
    return stream;
}

TEST(PackedBlocks, AStreamIsWhatZlibMakesAtLevelNine) {
    // Of few letters, so that each level finds other matches.
    std::mt19937 random(1);
    Bytes data;
    while (data.size() < 40000)
        data.push_back(static_cast<std::uint8_t>(u'a' + random() % 3));
    const Bytes before = data;
    ASSERT_NE(zlibStream(data, 8), zlibStream(data, 9));
    EXPECT_EQ(compressUint8(data), zlibStream(data, 9));
    EXPECT_EQ(data, before);
}

TEST(PackedBlocks, AValidStreamOfTheExactSizeComesBack) {
    for (Bytes data : {Bytes(), Bytes{1}, Bytes(100000, 7), manyBytes()}) {
        const Bytes stream = compressUint8(data);
        EXPECT_EQ(decompressUint8(stream.begin(), stream.size(), data.size()),
                  data);
    }
}

TEST(PackedBlocks, TheTrustingReaderGivesWhatZlibGot) {
    Bytes data = manyBytes();
    const Bytes stream = compressUint8(data);
    // A larger size gives the shorter truth, a smaller one cuts it.
    EXPECT_EQ(decompressUint8(stream.begin(), stream.size(), 9000), data);
    EXPECT_EQ(decompressUint8(stream.begin(), stream.size(), 100),
              Bytes(data.begin(), data.begin() + 100));
    EXPECT_EQ(decompressUint8(stream.begin(), 0, 100), Bytes());
}

TEST(PackedBlocks, ADamagedFormSaysSo) {
    EXPECT_STREQ(DamagedFormException().what(),
                 "The stored form is truncated or damaged.");
    EXPECT_TRUE(
        (std::is_convertible_v<DamagedFormException*, std::exception*>));
    EXPECT_FALSE(
        (std::is_convertible_v<DamagedFormException*, std::runtime_error*>));
}

}  // namespace
