#include <gtest/gtest.h>

#include <numeric>

#include "archive/Format.hpp"
#include "archive/SumTree.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

std::vector<std::uint64_t> sumsOf(const Bytes& body, unsigned shift,
                                  std::uint64_t level = 0) {
    std::vector<std::uint64_t> sums(SumTree::piecesIn(body.size(), shift));
    for (std::size_t i = 0; i < sums.size(); ++i)
        sums[i] = SumTree::pieceSum(body, shift, level, i);
    return sums;
}

Bytes someBytes(std::size_t size) {
    Bytes bytes(size);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{1});
    return bytes;
}

// The published test value of XXH64 for no bytes.
TEST(SumTreeTest, SumsAreXxh64) {
    EXPECT_EQ(sumOf({}, 0), 0xEF46DB3751D8E999U);
}

TEST(SumTreeTest, PiecesAreCountedUpToTheLastShortOne) {
    EXPECT_EQ(SumTree::piecesIn(0, 9), 0U);
    EXPECT_EQ(SumTree::piecesIn(512, 9), 1U);
    EXPECT_EQ(SumTree::piecesIn(513, 9), 2U);
}

TEST(SumTreeTest, OnePieceHasNoStoredLevel) {
    const auto levels = SumTree::levelsAbove(sumsOf(someBytes(512), 9), 9);
    EXPECT_TRUE(levels.stored.empty());
    EXPECT_EQ(levels.top, sumOf(someBytes(512), 0));
    EXPECT_EQ(SumTree::storedBytes(512, 9), 0U);
}

TEST(SumTreeTest, EachLevelSumsTheOneBelow) {
    // 65 pieces, whose sums fill more than one piece of 512 bytes.
    const Bytes body = someBytes(64 * 512 + 1);
    const auto sums = sumsOf(body, 9);
    ASSERT_EQ(sums.size(), 65U);
    const auto levels = SumTree::levelsAbove(sums, 9);
    Bytes level0;
    for (const std::uint64_t sum : sums) packUint64(sum, level0);
    Bytes level1;
    for (const std::uint64_t sum : sumsOf(level0, 9, 1))
        packUint64(sum, level1);
    ASSERT_EQ(level1.size(), 16U);
    EXPECT_EQ(levels.top, sumOf(level1, SumTree::seedOf(2, 0)));
    Bytes stored = level1;
    stored.insert(stored.end(), level0.begin(), level0.end());
    EXPECT_EQ(levels.stored, stored);
    EXPECT_EQ(SumTree::storedBytes(body.size(), 9), stored.size());
}

TEST(SumTreeTest, EqualPiecesHaveDifferentSums) {
    const auto sums = sumsOf(Bytes(1024), 9);
    EXPECT_NE(sums[0], sums[1]);
}

}  // namespace
}  // namespace tessel::archive
