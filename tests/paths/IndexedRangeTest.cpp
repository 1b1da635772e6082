// A function's results as a range.

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "paths/IndexedRange.hpp"

namespace {

using tessel::paths::IndexedRange;

std::size_t squareOf(std::size_t i) { return i * i; }

TEST(IndexedRange, HasTheResultOfEachIndex) {
    const IndexedRange squares(3, 6, squareOf);
    EXPECT_EQ(std::vector<std::size_t>(squares.begin(), squares.end()),
              (std::vector<std::size_t>{9, 16, 25}));
    EXPECT_EQ(squares.end() - squares.begin(), 3);
    EXPECT_EQ(squares.begin() - squares.end(), -3);
}

TEST(IndexedRange, CanBeReadAgain) {
    std::size_t calls = 0;
    const IndexedRange counted(0, 4, [&calls](std::size_t i) {
        ++calls;
        return i;
    });
    EXPECT_EQ(std::count(counted.begin(), counted.end(), 2U), 1);
    EXPECT_EQ(std::count(counted.begin(), counted.end(), 3U), 1);
    EXPECT_EQ(calls, 8U);
    auto at = counted.begin();
    EXPECT_EQ(*at++, 0U);
    EXPECT_EQ(*at, 1U);
}

TEST(IndexedRange, OneWithoutIndicesIsEmpty) {
    const IndexedRange none(5, 5, squareOf);
    EXPECT_TRUE(none.begin() == none.end());
}

}  // namespace
