// The hash of texts that come from outside.

#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <unordered_set>

#include "paths/PathHash.hpp"

namespace {

using tessel::paths::PathHash;

TEST(PathHash, IsThatOfTheBytes) {
    const std::string text("a\0b", 3);
    EXPECT_EQ(PathHash()(text), PathHash()(std::string(text)));
    EXPECT_NE(PathHash()(text), PathHash()("a"));
    EXPECT_EQ(PathHash()(""), PathHash()(std::string_view()));
}

// Of 10,000 texts, two share 32 bits in one run of a hundred; three pairs do
// in one of some million.
TEST(PathHash, RarelyCollides) {
    std::unordered_set<std::uint32_t> hashes;
    for (int i = 0; i < 10'000; ++i)
        hashes.insert(PathHash()("usr/share/doc/" + std::to_string(i)));
    EXPECT_GT(hashes.size(), 9'997U);
}

}  // namespace
