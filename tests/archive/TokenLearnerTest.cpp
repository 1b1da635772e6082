#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "archive/TokenLearner.hpp"

namespace tessel::archive {
namespace {

using Strings = std::vector<std::string>;

// Pieces of names; a zero byte follows each text by itself.
std::vector<Piece> piecesOf(const Strings& texts) {
    std::vector<Piece> pieces;
    for (const std::string& text : texts)
        pieces.push_back({text.c_str(),
                          static_cast<std::uint32_t>(text.size() + 1),
                          NameStart, false});
    return pieces;
}

LearnedTokens learned(const Strings& texts, unsigned threads = 1) {
    Workers workers(threads, {});
    return learnTokens(piecesOf(texts), 3, workers);
}

bool contains(const LearnedTokens& learned, const std::string& token) {
    return std::ranges::find(learned.tokens, token) != learned.tokens.end();
}

Strings manyNames() {
    Strings texts;
    for (int i = 0; i < 300; ++i)
        texts.push_back("report-" + std::to_string(i) + ".html");
    return texts;
}

TEST(TokenLearnerTest, SingleBytesAreAlwaysTokens) {
    const LearnedTokens result = learned({});
    ASSERT_EQ(result.tokens.size(), 256U);
    for (unsigned byte = 0; byte < 256; ++byte)
        EXPECT_EQ(result.tokens[byte], std::string(1, static_cast<char>(byte)));
}

TEST(TokenLearnerTest, FrequentStringsBecomeTokens) {
    const LearnedTokens result = learned(manyNames());
    EXPECT_TRUE(contains(result, "report-"));
    EXPECT_TRUE(contains(result, std::string(".html\0", 6)));
    EXPECT_FALSE(contains(result, "report-299"));
}

TEST(TokenLearnerTest, TokensAreDistinctAndShort) {
    const LearnedTokens result = learned(Strings(50, std::string(500, 'a')));
    Strings sorted = result.tokens;
    std::ranges::sort(sorted);
    EXPECT_EQ(std::ranges::adjacent_find(sorted), sorted.end());
    for (const std::string& token : sorted)
        EXPECT_LE(token.size(), maxTokenBytes);
}

// The learner's own cut covers every byte of the sample.
TEST(TokenLearnerTest, UsesCoverTheSample) {
    const Strings texts = manyNames();
    const LearnedTokens result = learned(texts);
    std::size_t bytes = 0;
    for (std::size_t t = 0; t < result.tokens.size(); ++t)
        for (std::size_t c = 0; c < contextSlots; ++c)
            bytes += result.uses.of(t, c) * result.tokens[t].size();
    std::size_t expected = 0;
    for (const std::string& text : texts) expected += text.size() + 1;
    EXPECT_EQ(bytes, expected);
}

TEST(TokenLearnerTest, UsesKnowTheContext) {
    const LearnedTokens result = learned(manyNames());
    const auto report = static_cast<std::size_t>(
        std::ranges::find(result.tokens, "report-") - result.tokens.begin());
    std::uint32_t elsewhere = 0;
    for (std::size_t c = NameAfterDigit; c < contextSlots; ++c)
        elsewhere += result.uses.of(report, c);
    EXPECT_EQ(elsewhere, 0U);
}

// Large enough for both stages, on one thread and on several.
TEST(TokenLearnerTest, ThreadsDoNotChangeTheResult) {
    Strings texts;
    for (int i = 0; i < 60'000; ++i)
        texts.push_back("file-" + std::to_string(i * 37 % 1000) + "-of-" +
                        std::to_string(i % 77) + ".cpp");
    const LearnedTokens one = learned(texts, 1);
    const LearnedTokens three = learned(texts, 3);
    EXPECT_EQ(one.tokens, three.tokens);
    EXPECT_TRUE(contains(one, std::string(".cpp\0", 5)));
    for (std::size_t t = 0; t < one.tokens.size(); ++t)
        for (std::size_t c = 0; c < contextSlots; ++c)
            ASSERT_EQ(one.uses.of(t, c), three.uses.of(t, c));
}

}  // namespace
}  // namespace tessel::archive
