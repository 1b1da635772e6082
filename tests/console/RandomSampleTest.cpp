#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "hosts/console/RandomSample.hpp"

namespace {

using Numbers = std::vector<std::uint64_t>;

Numbers sampleOf(std::uint64_t count, std::uint64_t size, std::uint64_t seed) {
    Numbers numbers;
    tessel::console::drawSample(count, size, seed, [&](std::uint64_t number) {
        numbers.push_back(number);
    });
    return numbers;
}

TEST(RandomSample, DrawsDifferentNumbersInOrder) {
    // Both ways to draw: few of many, and more than a 64th.
    for (const std::uint64_t count : {0U, 1U, 15U, 16U, 500U, 999U, 1000U})
        for (std::uint64_t seed = 0; seed < 50; ++seed) {
            const Numbers numbers = sampleOf(count, 1000, seed);
            ASSERT_EQ(numbers.size(), count);
            ASSERT_TRUE(std::ranges::is_sorted(numbers, std::less_equal<>()) ||
                        count < 2);
            ASSERT_EQ(std::ranges::adjacent_find(numbers), numbers.end());
            if (count > 0) {
                ASSERT_LT(numbers.back(), 1000U);
            }
        }
    EXPECT_TRUE(sampleOf(0, 0, 1).empty());
}

TEST(RandomSample, TheSeedDecides) {
    EXPECT_EQ(sampleOf(10, 1000, 7), sampleOf(10, 1000, 7));
    EXPECT_NE(sampleOf(10, 1000, 7), sampleOf(10, 1000, 8));
    EXPECT_EQ(sampleOf(3, 1000, 1), (Numbers{69, 448, 930}))
        << "the same on every machine, for good";
}

TEST(RandomSample, EachNumberIsAsLikely) {
    // 3 of 4 by the one way and 2 of 200 by the other; expected 3,000 and 40
    // times each, five standard deviations allowed.
    std::vector<int> many(4);
    std::vector<int> few(200);
    for (std::uint64_t seed = 0; seed < 4000; ++seed) {
        for (const auto number : sampleOf(3, 4, seed)) ++many[number];
        for (const auto number : sampleOf(2, 200, seed)) ++few[number];
    }
    for (const int times : many) EXPECT_NEAR(times, 3000, 140);
    for (const int times : few) EXPECT_NEAR(times, 40, 32);
}

}  // namespace
