// Bytes of paths to UTF-16 and back.

#include <gtest/gtest.h>
#include <rapidcheck.h>
#include <rapidcheck/gtest.h>

#include <string>

#include "paths/PathText.hpp"

namespace {

using namespace std::string_literals;
using tessel::paths::appendBytes;
using tessel::paths::appendText;
using tessel::paths::decodeCharacter;
using tessel::paths::toText;

// The bytes of a text, or "none".
std::string bytesOf(std::u16string_view text) {
    std::string bytes;
    return appendBytes(text, bytes) ? bytes : "none";
}

TEST(PathText, Utf8OfEveryLengthBecomesItsCharacters) {
    EXPECT_EQ(toText("a"), u"a");
    EXPECT_EQ(toText("\xC2\x80\xDF\xBF"), u"\x80\x7FF");
    EXPECT_EQ(toText("\xE0\xA0\x80\xEF\xBF\xBF"), u"\u0800\uFFFF");
    EXPECT_EQ(toText("\xED\x9F\xBF\xEE\x80\x80"), u"\uD7FF\uE000");
    EXPECT_EQ(toText("\xF0\x90\x80\x80"), u"\U00010000");
    EXPECT_EQ(toText("\xF4\x8F\xBF\xBF"), u"\U0010FFFF");
    EXPECT_EQ(toText("a\0b"s), u"a\0b"s);
}

TEST(PathText, OtherBytesBecomeOneLowSurrogateEach) {
    EXPECT_EQ(toText("\x80"), u"\xDC80");
    EXPECT_EQ(toText("\xFF"
                     "a"),
              u"\xDCFF"
              u"a");
    EXPECT_EQ(toText("\xC0\xAF"), u"\xDCC0\xDCAF") << "overlong, two bytes";
    EXPECT_EQ(toText("\xE0\x80\xAF"), u"\xDCE0\xDC80\xDCAF")
        << "overlong, three bytes";
    EXPECT_EQ(toText("\xF0\x80\x80\xAF"), u"\xDCF0\xDC80\xDC80\xDCAF")
        << "overlong, four bytes";
    EXPECT_EQ(toText("\xED\xA0\x80"), u"\xDCED\xDCA0\xDC80")
        << "an encoded high surrogate";
    EXPECT_EQ(toText("\xED\xB2\x80"), u"\xDCED\xDCB2\xDC80")
        << "an encoded low surrogate";
    EXPECT_EQ(toText("\xF4\x90\x80\x80"), u"\xDCF4\xDC90\xDC80\xDC80")
        << "above the last character";
    EXPECT_EQ(toText("\xF0\x9F\x98"), u"\xDCF0\xDC9F\xDC98") << "cut short";
    EXPECT_EQ(toText("\xE2\x82/\xAC"), u"\xDCE2\xDC82/\xDCAC") << "interrupted";
}

TEST(PathText, TextsThatNoBytesHaveAreRefused) {
    EXPECT_EQ(bytesOf(u"\xD800"), "none") << "half a pair";
    EXPECT_EQ(bytesOf(u"\xDC7F"), "none") << "no byte's surrogate";
    EXPECT_EQ(bytesOf(u"\xDD00"), "none");
    EXPECT_EQ(bytesOf(u"\xD83D"
                      u"a"),
              "none");
    EXPECT_EQ(bytesOf(u"\xDCC3\xDCA9"), "none") << "spells U+00E9";
    EXPECT_EQ(bytesOf(u"\xDCC3"), "\xC3");
    EXPECT_EQ(bytesOf(u"\xD83D\xDC80"), "\xF0\x9F\x92\x80")
        << "a pair whose second half could be a byte's";
}

TEST(PathText, ARefusedTextLeavesTheBytesAsTheyWere) {
    std::string bytes = "before";
    EXPECT_FALSE(appendBytes(u"abc\xD800", bytes));
    EXPECT_EQ(bytes, "before");
    EXPECT_FALSE(appendBytes(u"\xDCC3\xDCA9", bytes));
    EXPECT_EQ(bytes, "before");
    EXPECT_TRUE(appendBytes(u"+", bytes));
    EXPECT_EQ(bytes, "before+");
}

TEST(PathText, DecodingAppends) {
    std::u16string text = u"x";
    appendText("\xE2\x82\xAC", text);
    appendText("", text);
    EXPECT_EQ(text, u"x\u20AC");
}

// Bytes that are often nearly UTF-8.
rc::Gen<std::string> anyBytes() {
    return rc::gen::container<std::string>(rc::gen::oneOf(
        rc::gen::arbitrary<char>(),
        rc::gen::element('\x80', '\xA0', '\xBF', '\xC3', '\xE0', '\xED', '\xEF',
                         '\xF0', '\xF4', '\x90', 'a', '/')));
}

RC_GTEST_PROP(PathText, EveryByteStringComesBack, ()) {
    const std::string bytes = *anyBytes();
    std::string back;
    RC_ASSERT(appendBytes(toText(bytes), back));
    RC_ASSERT(back == bytes);
}

RC_GTEST_PROP(PathText, ATextIsEitherRefusedOrComesBack, ()) {
    const auto text = *rc::gen::container<std::u16string>(rc::gen::oneOf(
        rc::gen::arbitrary<char16_t>(),
        rc::gen::element<char16_t>(0xDC80, 0xDCC3, 0xDCA9, 0xDCF0, 0xDC9F,
                                   0xD83D, 0xDE00, u'a')));
    std::string bytes;
    if (appendBytes(text, bytes)) RC_ASSERT(toText(bytes) == text);
}

RC_GTEST_PROP(PathText, CharactersDecodeOneByOneAsTheyDoTogether, ()) {
    const std::string bytes = *anyBytes();
    std::u16string text;
    std::string_view rest = bytes;
    while (!rest.empty()) {
        const auto character = decodeCharacter(rest);
        // Alone, a character is the same as with what follows it.
        text += toText(rest.substr(0, character.byteCount));
        rest.remove_prefix(character.byteCount);
    }
    RC_ASSERT(text == toText(bytes));
}

}  // namespace
