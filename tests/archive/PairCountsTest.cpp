#include <gtest/gtest.h>

#include <map>
#include <random>

#include "archive/PairCounts.hpp"

namespace tessel::archive {
namespace {

TEST(PairCountsTest, PairsKeepTheirHalvesApart) {
    EXPECT_NE(pairOf(1, 2), pairOf(2, 1));
    EXPECT_EQ(pairOf(0xABCD, 0x1234), 0xABCD1234U);
}

TEST(PairCountsTest, ASketchIsNeverTooLow) {
    std::mt19937 random(1);
    PairSketch sketch(8);  // far too small, so that pairs collide
    std::map<TokenPair, int> exact;
    for (int i = 0; i < 5000; ++i) {
        const auto pair = static_cast<TokenPair>(random() % 600);
        sketch.add(pair);
        ++exact[pair];
    }
    for (const auto& [pair, count] : exact) EXPECT_GE(sketch[pair], count);
    EXPECT_GE(sketch.max(), 20);
    EXPECT_EQ(sketch.atLeast(0), 256U);
    EXPECT_GE(sketch.atLeast(sketch.max()), 1U);
    sketch.clear();
    EXPECT_EQ(sketch.max(), 0);
}

TEST(PairCountsTest, SketchesStayAtTheirLimit) {
    PairSketch a(8);
    PairSketch b(8);
    for (int i = 0; i < 70'000; ++i) a.add(7);
    EXPECT_EQ(a[7], UINT16_MAX);
    b.add(7);
    b += a;
    EXPECT_EQ(b[7], UINT16_MAX);
}

TEST(PairCountsTest, TheSumOfSketchesIsTheSketchOfAll) {
    PairSketch a(10);
    PairSketch b(10);
    PairSketch all(10);
    for (TokenPair pair = 0; pair < 3000; ++pair) {
        (pair % 3 == 0 ? a : b).add(pair);
        all.add(pair);
    }
    a += b;
    for (TokenPair pair = 0; pair < 3000; ++pair) ASSERT_EQ(a[pair], all[pair]);
}

TEST(PairCountsTest, ATableCountsExactly) {
    std::mt19937 random(2);
    PairTable table;
    table.reset(800);
    std::map<TokenPair, std::uint32_t> exact;
    for (int i = 0; i < 20'000; ++i) {
        const auto pair = static_cast<TokenPair>(random() % 800 * 65537);
        table.add(pair, 2);
        exact[pair] += 2;
    }
    for (const auto& [pair, count] : exact) {
        EXPECT_EQ(table.find(pair).pair, pair);
        EXPECT_EQ(table.find(pair).count, count);
    }
    EXPECT_EQ(table.find(12345).pair, PairTable::noPair);
    table.reset(10);
    EXPECT_EQ(table.find(0).pair, PairTable::noPair);
}

// A sketch tells fewer pairs than there are if some share a count.
TEST(PairCountsTest, ATableTakesMorePairsThanExpected) {
    PairTable table;
    table.reset(1);
    for (TokenPair pair = 1; pair <= 5000; ++pair)
        table.add(pair * 65537, pair);
    for (TokenPair pair = 1; pair <= 5000; ++pair) {
        ASSERT_EQ(table.find(pair * 65537).pair, pair * 65537);
        ASSERT_EQ(table.find(pair * 65537).count, pair);
    }
    EXPECT_EQ(table.find(12345).pair, PairTable::noPair);
    EXPECT_GE(table.entries().size(), 10'000U);
    table.reset(1);
    table.add(65537, 1);
    EXPECT_EQ(table.find(65537).count, 1U);
}

}  // namespace
}  // namespace tessel::archive
