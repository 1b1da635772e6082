#include <gtest/gtest.h>

#include <cstddef>
#include <random>
#include <string>
#include <string_view>

#include "archive/ByteSearch.hpp"

namespace tessel::archive {
namespace {

TEST(ByteSearch, FindsTheTextAnywhere) {
    const ByteSearch search("libx");
    EXPECT_TRUE(search.isIn("libx"));
    EXPECT_TRUE(search.isIn("usr/lib/libx"));
    EXPECT_TRUE(search.isIn("libx11.so"));
    EXPECT_TRUE(search.isIn("xxlibxx"));
}

TEST(ByteSearch, DoesNotFindPartsOfIt) {
    const ByteSearch search("libx");
    for (const std::string_view hay : {"", "l", "lib", "ibx", "lib/x", "x"})
        EXPECT_FALSE(search.isIn(hay)) << hay;
}

TEST(ByteSearch, StaysWithinTheHay) {
    const std::string_view all = "alibxb";
    EXPECT_FALSE(ByteSearch("libx").isIn(all.substr(0, 4)));
    EXPECT_FALSE(ByteSearch("libx").isIn(all.substr(2)));
    EXPECT_TRUE(ByteSearch("libx").isIn(all.substr(1, 4)));
}

TEST(ByteSearch, AgreesWithTheStandardSearch) {
    std::mt19937 random(7);
    const auto letters = [&](std::size_t size) {
        std::string text(size, ' ');
        for (char& c : text) c = "ab\xFF"[random() % 3];
        return text;
    };
    for (int run = 0; run < 20'000; ++run) {
        const std::string text = letters(1 + random() % 4);
        const std::string hay = letters(random() % 12);
        ASSERT_EQ(ByteSearch(text).isIn(hay), hay.find(text) != hay.npos)
            << text << " in " << hay;
    }
}

}  // namespace
}  // namespace tessel::archive
