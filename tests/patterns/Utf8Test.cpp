#include <gtest/gtest.h>

#include "hosts/patterns/Utf8.hpp"

namespace {

using tessel::patterns::isUtf8;

TEST(Utf8, IsReadStrictly) {
    EXPECT_TRUE(isUtf8(""));
    EXPECT_TRUE(isUtf8("plain"));
    EXPECT_TRUE(isUtf8("\xC3\xBC\xE2\x82\xAC\xF0\x9F\x98\x80"));
    EXPECT_FALSE(isUtf8("\xFF"));
    EXPECT_FALSE(isUtf8("a\xC3")) << "cut";
    EXPECT_FALSE(isUtf8("\xC0\x80")) << "overlong";
    EXPECT_FALSE(isUtf8("\xED\xB2\x80")) << "a surrogate";
    EXPECT_FALSE(isUtf8("\xF4\x90\x80\x80")) << "beyond the last character";
}

}  // namespace
