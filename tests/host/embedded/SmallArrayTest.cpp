#include <gtest/gtest.h>

#include "hosts/embedded/SmallArray.hpp"

namespace tessel::embedded {

TEST(SmallArrayTest, ElementsAreNullAndSeparateAtEverySize) {
    for (std::size_t count = 0; count <= 9; ++count) {
        SmallArray<const int*, 4> array(count);
        ASSERT_EQ(array.size(), count);
        int targets[9] = {};
        for (std::size_t i = 0; i < count; ++i) {
            EXPECT_EQ(array[i], nullptr);
            array[i] = &targets[i];
        }
        for (std::size_t i = 0; i < count; ++i)
            EXPECT_EQ(array.data()[i], &targets[i]);
    }
}

TEST(SmallArrayTest, FewElementsAreInTheObject) {
    const SmallArray<int, 4> few(4);
    const SmallArray<int, 4> many(5);
    const auto isInside = [](const SmallArray<int, 4>& array) {
        const auto* const begin = reinterpret_cast<const char*>(&array);
        const auto* const data = reinterpret_cast<const char*>(array.data());
        return data >= begin && data < begin + sizeof array;
    };
    EXPECT_TRUE(isInside(few));
    EXPECT_FALSE(isInside(many));
}

}  // namespace tessel::embedded
