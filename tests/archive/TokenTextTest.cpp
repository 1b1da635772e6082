#include <gtest/gtest.h>

#include "archive/TokenText.hpp"

namespace tessel::archive {
namespace {

using Tokens = std::vector<std::string>;

TokenText textOf(const Tokens& tokens, const std::vector<bool>& wanted) {
    return TokenText(tokens, wanted, TokenTrie(tokens));
}

std::string placed(const TokenText& text, const Tokens& tokens,
                   std::size_t token) {
    return text.text().substr(text.offsetOf(token),
                              tokenBody(tokens[token]).size());
}

TEST(TokenTextTest, AnEndIsNoText) {
    EXPECT_EQ(tokenBody("abc"), "abc");
    EXPECT_EQ(tokenBody(std::string("abc\0", 4)), "abc");
    EXPECT_EQ(tokenBody(std::string(1, '\0')), "");
    EXPECT_EQ(tokenBody(""), "");
}

TEST(TokenTextTest, PartsOfLongerTokensTakeNoRoom) {
    const Tokens tokens = {"tion",
                           "information",
                           "form",
                           "i",
                           "zeta",
                           "xinfo",
                           std::string("mation\0", 7)};
    const TokenText text = textOf(tokens, std::vector<bool>(7, true));
    EXPECT_EQ(text.text().size(), 11U + 5 + 4);
    for (std::size_t t = 0; t < tokens.size(); ++t)
        EXPECT_EQ(placed(text, tokens, t), tokenBody(tokens[t]));
}

TEST(TokenTextTest, UnwantedTokensAreLeftOut) {
    const Tokens tokens = {"abc", "xyz", "bc"};
    const TokenText text = textOf(tokens, {false, true, true});
    EXPECT_EQ(text.text(), "xyzbc");
    EXPECT_EQ(placed(text, tokens, 2), "bc");
}

TEST(TokenTextTest, OnlyAnEndHasEmptyText) {
    const Tokens tokens = {std::string(1, '\0')};
    const TokenText text = textOf(tokens, {true});
    EXPECT_TRUE(text.text().empty());
    EXPECT_EQ(text.offsetOf(0), 0U);
}

}  // namespace
}  // namespace tessel::archive
