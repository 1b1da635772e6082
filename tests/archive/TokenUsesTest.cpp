#include <gtest/gtest.h>

#include "archive/TokenUses.hpp"

namespace tessel::archive {
namespace {

TEST(TokenUsesTest, AStepKeepsItsParts) {
    TokenRef step = TokenRef::token(123'456, 6);
    EXPECT_FALSE(step.isLiteral());
    EXPECT_EQ(step.value(), 123'456U);
    EXPECT_EQ(step.context(), 6);
    EXPECT_FALSE(step.isLast());
    step.markLast();
    EXPECT_TRUE(step.isLast());
    EXPECT_EQ(step.value(), 123'456U);
    EXPECT_EQ(step.context(), 6);
    const TokenRef literal = TokenRef::literal(0xFF, firstTokenContext);
    EXPECT_TRUE(literal.isLiteral());
    EXPECT_EQ(literal.value(), 0xFFU);
    EXPECT_EQ(literal.context(), firstTokenContext);
}

TEST(TokenUsesTest, CountsByTokenAndContext) {
    TokenUses uses(3);
    uses.add(TokenRef::token(1, 0));
    uses.add(TokenRef::token(1, 0));
    uses.add(TokenRef::token(1, 7));
    uses.add(TokenRef::literal('x', 2));
    uses.add(TokenRef::literal('x', firstTokenContext));
    EXPECT_EQ(uses.of(1, 0), 2U);
    EXPECT_EQ(uses.of(1, 7), 1U);
    EXPECT_EQ(uses.of(1, 1), 0U);
    EXPECT_EQ(uses.literals(2), 1U);
    EXPECT_EQ(uses.firstLiterals('x'), 1U);
    EXPECT_EQ(uses.firstLiterals('y'), 0U);
    EXPECT_TRUE(uses.isUsed(1));
    EXPECT_FALSE(uses.isUsed(0));
    EXPECT_FALSE(uses.isUsed(2));
}

TEST(TokenUsesTest, Adds) {
    TokenUses a(2);
    TokenUses b(2);
    a.add(TokenRef::token(0, 3));
    b.add(TokenRef::token(0, 3));
    b.add(TokenRef::token(1, 4));
    b.add(TokenRef::literal('q', 5));
    a += b;
    EXPECT_EQ(a.of(0, 3), 2U);
    EXPECT_EQ(a.of(1, 4), 1U);
    EXPECT_EQ(a.literals(5), 1U);
}

}  // namespace
}  // namespace tessel::archive
