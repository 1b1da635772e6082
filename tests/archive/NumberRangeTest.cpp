#include <gtest/gtest.h>

#include <vector>

#include "archive/NumberRange.hpp"

namespace tessel::archive {
namespace {

TEST(NumberRange, NeighboursBecomeOne) {
    std::vector<NumberRange> list;
    for (const NumberRange range :
         {NumberRange{1, 2}, {2, 5}, {5, 5}, {7, 8}, {9, 9}, {10, 12}})
        appendRange(list, range);
    EXPECT_EQ(list, (std::vector<NumberRange>{{1, 5}, {7, 8}, {10, 12}}));
}

}  // namespace
}  // namespace tessel::archive
