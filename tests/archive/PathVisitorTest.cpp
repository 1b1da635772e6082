#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <type_traits>

#include "archive/PathVisitor.hpp"

namespace tessel {
namespace {

TEST(PathVisitor, HandsOnNumberAndPath) {
    std::uint64_t number = 0;
    std::string path;
    auto keep = [&](std::uint64_t n, std::string_view p) {
        number = n;
        path = p;
    };
    EXPECT_TRUE(PathVisitor(keep)(7, "a/b"));
    EXPECT_EQ(number, 7U);
    EXPECT_EQ(path, "a/b");
}

TEST(PathVisitor, EndsTheVisitOnFalseOnly) {
    auto stopAt3 = [](std::uint64_t n, std::string_view) { return n != 3; };
    const PathVisitor visitor = stopAt3;
    EXPECT_TRUE(visitor(2, ""));
    EXPECT_FALSE(visitor(3, ""));
}

TEST(PathVisitor, TakesOnlyWhatFits) {
    const auto noNumber = [](std::string_view) {};
    EXPECT_FALSE((std::is_constructible_v<PathVisitor, decltype(noNumber)>));
}

}  // namespace
}  // namespace tessel
