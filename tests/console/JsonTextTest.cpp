#include <gtest/gtest.h>

#include "hosts/console/JsonText.hpp"

namespace {

using tessel::console::base64;
using tessel::console::jsonOfBytes;

TEST(JsonText, Base64) {
    EXPECT_EQ(base64(""), "");
    EXPECT_EQ(base64("f"), "Zg==");
    EXPECT_EQ(base64("fo"), "Zm8=");
    EXPECT_EQ(base64("foo"), "Zm9v");
    EXPECT_EQ(base64("foobar"), "Zm9vYmFy");
    EXPECT_EQ(base64("\xFF\xFE\xFD"), "//79");
}

TEST(JsonText, BytesAreTextOnlyIfTheyAreUtf8) {
    EXPECT_EQ(jsonOfBytes("a\"\n\xC3\xBC").dump(), "\"a\\\"\\n\xC3\xBC\"");
    EXPECT_EQ(jsonOfBytes("a\xFF").dump(), "{\"bytes\":\"Yf8=\"}");
}

}  // namespace
