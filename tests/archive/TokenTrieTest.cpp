#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>

#include "archive/TokenTrie.hpp"

namespace tessel::archive {
namespace {

using Tokens = std::vector<std::string>;

// The tokens that begin the text, by length.
std::map<std::size_t, std::uint32_t> found(const TokenTrie& trie,
                                           const std::string& text) {
    std::map<std::size_t, std::uint32_t> result;
    TokenTrie::Base base = trie.root();
    std::uint32_t token = 0;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (!trie.step(base, static_cast<std::uint8_t>(text[i]), token)) break;
        if (token != TokenTrie::noToken) result[i + 1] = token;
    }
    return result;
}

void expectFinds(const Tokens& tokens, const std::string& text) {
    std::map<std::size_t, std::uint32_t> expected;
    for (std::uint32_t t = 0; t < tokens.size(); ++t)
        if (text.starts_with(tokens[t])) expected[tokens[t].size()] = t;
    EXPECT_EQ(found(TokenTrie(tokens), text), expected) << text;
}

TEST(TokenTrieTest, FindsAllTokensAtAPlace) {
    const Tokens tokens = {"b",  "a", "abc", "ab", std::string("ab\0", 3),
                           "bcd"};
    for (const std::string& text :
         {std::string("abcd"), std::string("ab\0", 3), std::string("bcx"),
          std::string("c"), std::string()})
        expectFinds(tokens, text);
}

TEST(TokenTrieTest, NoTokensFindNothing) {
    EXPECT_TRUE(found(TokenTrie(Tokens{}), "abc").empty());
    const TokenTrie trie(Tokens{"a"});
    std::uint32_t token = 0;
    for (unsigned byte = 0; byte < 256; ++byte) {
        TokenTrie::Base next = trie.root();
        EXPECT_EQ(trie.step(next, static_cast<std::uint8_t>(byte), token),
                  byte == 'a');
    }
}

TEST(TokenTrieTest, AllBytesCanBeLabels) {
    Tokens tokens;
    for (unsigned byte = 0; byte < 256; ++byte) {
        tokens.emplace_back(1, static_cast<char>(byte));
        tokens.push_back(tokens.back() + tokens.back());
    }
    for (unsigned byte = 0; byte < 256; ++byte)
        expectFinds(tokens, std::string(3, static_cast<char>(byte)));
}

TEST(TokenTrieTest, FindsRandomTokensLikeAPlainSearch) {
    std::mt19937 random(5);
    const auto draw = [&](std::size_t length) {
        std::string text(length, ' ');
        for (char& c : text) c = static_cast<char>(random() % 4 * 85);
        return text;
    };
    std::map<std::string, int> distinct;
    while (distinct.size() < 1500) distinct[draw(1 + random() % 9)] = 0;
    Tokens tokens;
    for (const auto& [text, unused] : distinct) tokens.push_back(text);
    std::shuffle(tokens.begin(), tokens.end(), random);
    const TokenTrie trie(tokens);
    for (int i = 0; i < 500; ++i) {
        const std::string text = draw(12);
        std::map<std::size_t, std::uint32_t> expected;
        for (std::uint32_t t = 0; t < tokens.size(); ++t)
            if (text.starts_with(tokens[t])) expected[tokens[t].size()] = t;
        ASSERT_EQ(found(trie, text), expected);
    }
}

}  // namespace
}  // namespace tessel::archive
