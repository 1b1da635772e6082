// Growing by an eighth, and giving memory back.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "pathtree/containers.hpp"

namespace {

TEST(Containers, RoomIsMadeForSoManyAndAnEighthMore) {
    std::vector<int> list(800);
    list.shrink_to_fit();
    tessel::reserveGently(list, 0);
    EXPECT_EQ(list.capacity(), 800U);
    tessel::reserveGently(list, 80);
    EXPECT_EQ(list.capacity(), 990U);
    EXPECT_EQ(list.size(), 800U);
    tessel::reserveGently(list, 190);
    EXPECT_EQ(list.capacity(), 990U);
}

TEST(Containers, ReleasedContentsTakeNoMemory) {
    std::vector<std::string> list = {"a", "b"};
    tessel::releaseContents(list);
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(list.capacity(), 0U);
}

}  // namespace
