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

TEST(NumberRange, ChunksCoverItOnce) {
    for (const NumberRange range :
         {NumberRange{0, 0}, {3, 3}, {3, 4}, {3, 10}, {3, 11}, {3, 12}}) {
        std::uint64_t next = range.begin;
        for (std::uint64_t i = 0; i < chunkCount(range, 4); ++i) {
            const NumberRange chunk = chunkOf(range, 4, i);
            EXPECT_EQ(chunk.begin, next);
            EXPECT_TRUE(chunk.end - chunk.begin == 4 || chunk.end == range.end);
            EXPECT_LT(chunk.begin, chunk.end);
            next = chunk.end;
        }
        EXPECT_EQ(next, range.end);
    }
}

}  // namespace
}  // namespace tessel::archive
