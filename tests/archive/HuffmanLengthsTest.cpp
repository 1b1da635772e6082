#include <gtest/gtest.h>

#include <numeric>

#include "archive/HuffmanLengths.hpp"

namespace tessel::archive {
namespace {

using Counts = std::vector<std::uint64_t>;
using Lengths = std::vector<std::uint8_t>;

// The sum of 2^-length, in units of 2^-32.
std::uint64_t kraftSum(const Lengths& lengths) {
    std::uint64_t sum = 0;
    for (const std::uint8_t length : lengths)
        if (length > 0) sum += std::uint64_t{1} << (32 - length);
    return sum;
}

std::uint64_t costOf(const Counts& counts, const Lengths& lengths) {
    return std::inner_product(counts.begin(), counts.end(), lengths.begin(),
                              std::uint64_t{0});
}

TEST(HuffmanLengthsTest, FrequentSymbolsAreShort) {
    EXPECT_EQ(huffmanLengths(Counts{8, 0, 1, 1, 4}, 24),
              (Lengths{1, 0, 3, 3, 2}));
}

TEST(HuffmanLengthsTest, FewerThanTwoSymbolsTakeNoBits) {
    EXPECT_EQ(huffmanLengths(Counts{}, 24), Lengths{});
    EXPECT_EQ(huffmanLengths(Counts{0, 5, 0}, 24), (Lengths{0, 0, 0}));
}

// Fibonacci counts make the deepest trees.
TEST(HuffmanLengthsTest, NoLengthIsAboveTheLimit) {
    Counts counts = {1, 1};
    while (counts.size() < 60)
        counts.push_back(counts.back() + counts[counts.size() - 2]);
    for (const unsigned limit : {6U, 8U, 10U, 24U}) {
        const Lengths lengths = huffmanLengths(counts, limit);
        EXPECT_LE(*std::max_element(lengths.begin(), lengths.end()), limit);
        EXPECT_EQ(kraftSum(lengths), std::uint64_t{1} << 32) << limit;
    }
}

TEST(HuffmanLengthsTest, AFullAlphabetFitsItsLimit) {
    Counts counts(256, 1);
    counts[0] = 1'000'000'000'000;
    const Lengths lengths = huffmanLengths(counts, 8);
    EXPECT_EQ(kraftSum(lengths), std::uint64_t{1} << 32);
    EXPECT_LE(*std::max_element(lengths.begin(), lengths.end()), 8);
}

TEST(HuffmanLengthsTest, EqualCountsCostLog2) {
    const Counts counts(64, 3);
    EXPECT_EQ(costOf(counts, huffmanLengths(counts, 24)), 64U * 3 * 6);
}

TEST(HuffmanLengthsTest, CanonicalCodesCountUpwards) {
    EXPECT_EQ(canonicalCodes(Lengths{2, 0, 1, 3, 3}),
              (std::vector<std::uint32_t>{0b10, 0, 0b0, 0b110, 0b111}));
}

TEST(HuffmanLengthsTest, NoCanonicalCodeIsAPrefixOfAnother) {
    Counts counts(300);
    std::iota(counts.begin(), counts.end(), std::uint64_t{1});
    const Lengths lengths = huffmanLengths(counts, 24);
    const auto codes = canonicalCodes(lengths);
    for (std::size_t a = 0; a < counts.size(); ++a)
        for (std::size_t b = 0; b < counts.size(); ++b)
            if (a != b && lengths[a] <= lengths[b]) {
                ASSERT_NE(codes[b] >> (lengths[b] - lengths[a]), codes[a]);
            }
}

}  // namespace
}  // namespace tessel::archive
