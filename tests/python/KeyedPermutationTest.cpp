#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "hosts/python/KeyedPermutation.hpp"

namespace {

using tessel::python::KeyedPermutation;

TEST(KeyedPermutation, HasEachNumberOnceAndFindsItAgain) {
    for (std::uint64_t size = 0; size <= 130; ++size) {
        const KeyedPermutation order(size, size * 977);
        std::vector<bool> seen(size);
        for (std::uint64_t i = 0; i < size; ++i) {
            const std::uint64_t number = order[i];
            ASSERT_LT(number, size);
            EXPECT_FALSE(seen[number]);
            seen[number] = true;
            EXPECT_EQ(order.indexOf(number), i);
        }
    }
}

TEST(KeyedPermutation, WorksOnEverySize) {
    for (unsigned bits = 1; bits < 64; ++bits)
        for (std::uint64_t more = 0; more < 2; ++more) {
            const std::uint64_t size = (std::uint64_t{1} << bits) + more;
            const KeyedPermutation order(size, 5);
            for (const std::uint64_t i : {std::uint64_t{0}, size / 2, size - 1})
                EXPECT_EQ(order.indexOf(order[i]), i) << size;
        }
}

TEST(KeyedPermutation, KeepsItsOrdersForever) {
    const KeyedPermutation order(1000, 42);
    const std::vector<std::uint64_t> kept = {998, 721, 62, 193, 563, 996};
    for (std::size_t i = 0; i < kept.size(); ++i) EXPECT_EQ(order[i], kept[i]);
}

}  // namespace
