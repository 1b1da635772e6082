#include <gtest/gtest.h>

#include "archive/BitWriter.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

TEST(BitWriterTest, TheFirstBitIsTheHighest) {
    BitWriter out;
    out.put(0b1, 1);
    out.put(0b0110, 4);
    out.put(0b101, 3);
    EXPECT_EQ(out.take(), Bytes{0b10110101});
}

TEST(BitWriterTest, AlignFillsWithZeros) {
    BitWriter out;
    out.put(0b11, 2);
    out.align();
    EXPECT_EQ(out.bytes(), 1U);
    out.align();
    out.put(0xAB, 8);
    EXPECT_EQ(out.take(), (Bytes{0xC0, 0xAB}));
}

TEST(BitWriterTest, NoBitsChangeNothing) {
    BitWriter out;
    out.put(0, 0);
    EXPECT_TRUE(out.take().empty());
}

// Against a plain list of bits, with widths that cross every word boundary.
TEST(BitWriterTest, WritesWhatAPlainListOfBitsHolds) {
    BitWriter out;
    std::vector<bool> bits;
    std::uint64_t state = 1;
    for (int i = 0; i < 5000; ++i) {
        state = state * 6364136223846793005U + 1442695040888963407U;
        const auto width = static_cast<unsigned>(state >> 33U) % 33;
        const auto value =
            width == 0
                ? 0U
                : static_cast<std::uint32_t>(state >> 31U) >> (32 - width);
        out.put(value, width);
        for (unsigned b = width; b-- > 0;)
            bits.push_back((value >> b & 1U) != 0);
        if (i % 7 == 0) {
            out.align();
            while (bits.size() % 8 != 0) bits.push_back(false);
            ASSERT_EQ(out.bytes(), bits.size() / 8);
        }
    }
    while (bits.size() % 8 != 0) bits.push_back(false);
    const Bytes bytes = out.take();
    ASSERT_EQ(bytes.size(), bits.size() / 8);
    for (std::size_t i = 0; i < bits.size(); ++i)
        ASSERT_EQ((bytes[i / 8] >> (7 - i % 8) & 1U) != 0, bits[i]) << i;
}

TEST(BitWriterTest, AWriterCanBeUsedAgain) {
    BitWriter out;
    out.put(5, 8);
    EXPECT_EQ(out.take(), Bytes{5});
    out.put(6, 8);
    EXPECT_EQ(out.take(), Bytes{6});
}

}  // namespace
}  // namespace tessel::archive
