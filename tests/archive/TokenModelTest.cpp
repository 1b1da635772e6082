#include <gtest/gtest.h>

#include <algorithm>

#include "archive/TokenModel.hpp"

namespace tessel::archive {
namespace {

using Tokens = std::vector<std::string>;

void addUses(TokenUses& uses, std::uint32_t token, std::uint8_t context,
             int times) {
    for (int i = 0; i < times; ++i) uses.add(TokenRef::token(token, context));
}

std::uint32_t numberOf(const TokenModel& model, const std::string& token) {
    return static_cast<std::uint32_t>(std::ranges::find(model.tokens(), token) -
                                      model.tokens().begin());
}

std::uint8_t costOf(const TokenModel& model, const std::string& token,
                    std::size_t context) {
    return model.costs()[numberOf(model, token) * contextSlots + context];
}

TEST(TokenModelTest, RareTokensAreDropped) {
    TokenUses uses(3);
    addUses(uses, 0, 1, 10);
    addUses(uses, 1, 1, 9);
    addUses(uses, 2, 1, 30);
    const TokenModel model(Tokens{"ten", "nine", "thirty"}, uses, 10);
    EXPECT_EQ(model.tokens(), (Tokens{"thirty", "ten"}));
}

TEST(TokenModelTest, CostsAreLogarithms) {
    TokenUses uses(2);
    addUses(uses, 0, 1, 1023);
    addUses(uses, 1, 1, 3069);
    addUses(uses, 1, 2, 1023);
    const TokenModel model(Tokens{"ab", "cd"}, uses, 1);
    // A quarter, three quarters, and all of the uses.
    EXPECT_EQ(costOf(model, "ab", 1), 2 * TokenModel::costUnit);
    EXPECT_EQ(costOf(model, "cd", 1), 3);
    EXPECT_LE(costOf(model, "cd", 2), 3);
    EXPECT_EQ(costOf(model, "ab", 2), TokenModel::unexpected);
}

// After a shared prefix, the first byte is known already.
TEST(TokenModelTest, FirstTokensCostByTheirFirstByte) {
    TokenUses uses(3);
    addUses(uses, 0, firstTokenContext, 1000);
    addUses(uses, 1, firstTokenContext, 1000);
    addUses(uses, 2, firstTokenContext, 1000);
    const TokenModel model(Tokens{"aa", "ab", "bb"}, uses, 1);
    EXPECT_EQ(costOf(model, "aa", firstTokenContext), TokenModel::costUnit);
    EXPECT_EQ(costOf(model, "ab", firstTokenContext), TokenModel::costUnit);
    EXPECT_EQ(costOf(model, "bb", firstTokenContext), 0);
}

TEST(TokenModelTest, LiteralsTakeTheRareBytes) {
    TokenUses uses(3);
    addUses(uses, 0, 1, 100);
    addUses(uses, 1, 1, 1);
    addUses(uses, 2, firstTokenContext, 100);
    const TokenModel model(Tokens{"ab", "x", "y"}, uses, 5);
    EXPECT_EQ(model.tokens(), Tokens{"ab"});
    // A literal in a context spends eight bits on the byte.
    EXPECT_GT(model.literalCost(1, 'x'), 8 * TokenModel::costUnit);
    EXPECT_LT(model.literalCost(1, 'x'), model.literalCost(2, 'x') + 100);
    // One after a shared prefix spends none: there is nothing else here.
    EXPECT_LE(model.literalCost(firstTokenContext, 'y'), 1U);
}

TEST(TokenModelTest, TheTrieFindsTheTokensByTheirNumbers) {
    TokenUses uses(2);
    addUses(uses, 0, 1, 5);
    addUses(uses, 1, 1, 6);
    const TokenModel model(Tokens{"a", "b"}, uses, 1);
    TokenTrie::Base base = model.trie().root();
    std::uint32_t token = 0;
    ASSERT_TRUE(model.trie().step(base, 'a', token));
    EXPECT_EQ(model.tokens()[token], "a");
}

}  // namespace
}  // namespace tessel::archive
