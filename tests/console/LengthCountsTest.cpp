#include <gtest/gtest.h>

#include <numeric>

#include "hosts/console/LengthCounts.hpp"

namespace {

using tessel::console::LengthCounts;

TEST(LengthCounts, OfNothing) {
    const LengthCounts counts;
    EXPECT_EQ(counts.shortest(), 0U);
    EXPECT_EQ(counts.longest(), 0U);
    EXPECT_EQ(counts.median(), 0U);
    EXPECT_TRUE(counts.bins(10).empty());
}

TEST(LengthCounts, Extremes) {
    LengthCounts counts;
    for (const std::size_t length : {3U, 5U, 5U, 9U}) counts.add(length);
    EXPECT_EQ(counts.paths(), 4U);
    EXPECT_EQ(counts.shortest(), 3U);
    EXPECT_EQ(counts.median(), 5U);
    EXPECT_EQ(counts.longest(), 9U);
}

TEST(LengthCounts, BinsHoldEveryPath) {
    LengthCounts counts;
    for (std::size_t i = 0; i < 1000; ++i) counts.add(i % 100);
    counts.add(100'000);
    const auto bins = counts.bins(10);
    ASSERT_EQ(bins.size(), 10U);
    EXPECT_EQ(bins[0].begin, 0U);
    EXPECT_EQ(bins[0].end, 10U);
    EXPECT_EQ(bins[0].paths, 100U);
    EXPECT_EQ(bins[9].end, 100'001U) << "the last one holds the rest";
    EXPECT_EQ(bins[9].paths, 101U);
}

}  // namespace
