#include <gtest/gtest.h>

#include <limits>
#include <random>

#include "archive/PieceParser.hpp"

namespace tessel::archive {
namespace {

using Steps = std::vector<TokenRef>;

// A model over two letters with random uses.
TokenModel randomModel(std::mt19937& random) {
    std::vector<std::string> tokens;
    for (const char* token : {"a", "b", "ab", "ba", "aab", "bab", "abab"})
        tokens.emplace_back(token);
    tokens.emplace_back(1, '\0');
    tokens.emplace_back("b\0", 2);
    TokenUses uses(tokens.size());
    for (std::uint32_t t = 0; t < tokens.size(); ++t)
        for (std::uint8_t c = 0; c < contextSlots; ++c)
            for (std::size_t n = random() % 40; n > 0; --n)
                uses.add(TokenRef::token(t, c));
    return TokenModel(tokens, uses, 2);
}

std::string randomText(std::mt19937& random, std::size_t length) {
    std::string text(length, 'a');
    for (char& c : text) c = random() % 2 == 0 ? 'a' : 'b';
    return text;
}

Piece pieceOf(const std::string& text, std::uint8_t context) {
    return {text.c_str(), static_cast<std::uint32_t>(text.size() + 1), context,
            false};
}

std::uint32_t costOf(const TokenModel& model, const Steps& steps) {
    std::uint32_t cost = 0;
    for (const TokenRef step : steps)
        cost +=
            step.isLiteral()
                ? model.literalCost(step.context(),
                                    static_cast<std::uint8_t>(step.value()))
                : model.costs()[step.value() * contextSlots + step.context()];
    return cost;
}

// Checks that the steps spell the piece, each in the right context.
void expectSpells(const TokenModel& model, const Piece& piece,
                  const Steps& steps) {
    std::string spelled;
    for (const TokenRef& step : steps) {
        EXPECT_EQ(step.isLast(), &step == &steps.back());
        EXPECT_EQ(
            step.context(),
            spelled.empty()
                ? piece.context
                : nameContexts[static_cast<std::uint8_t>(spelled.back())]);
        if (step.isLiteral())
            spelled += static_cast<char>(step.value());
        else
            spelled += model.tokens()[step.value()];
    }
    EXPECT_EQ(spelled, std::string(piece.text, piece.length));
}

// The least cost of what follows `at`, by trying everything.
std::uint32_t leastCost(const TokenModel& model, const Piece& piece,
                        std::uint32_t at) {
    if (at == piece.length) return 0;
    const std::uint8_t context =
        at == 0 ? piece.context
                : nameContexts[static_cast<std::uint8_t>(piece.text[at - 1])];
    const std::string rest(piece.text + at, piece.length - at);
    std::uint32_t least =
        model.literalCost(context, static_cast<std::uint8_t>(rest.front())) +
        leastCost(model, piece, at + 1);
    for (std::uint32_t t = 0; t < model.tokens().size(); ++t) {
        const std::string& token = model.tokens()[t];
        if (!rest.starts_with(token)) continue;
        const std::uint32_t cost =
            model.costs()[t * contextSlots + context] +
            leastCost(model, piece,
                      at + static_cast<std::uint32_t>(token.size()));
        least = std::min(least, cost);
    }
    return least;
}

TEST(PieceParserTest, FullEffortFindsTheLeastCost) {
    std::mt19937 random(23);
    for (int round = 0; round < 200; ++round) {
        const TokenModel model = randomModel(random);
        const std::string text = randomText(random, random() % 9);
        const Piece piece = pieceOf(text, text.empty() || round % 2 == 0
                                              ? std::uint8_t{NameStart}
                                              : firstTokenContext);
        Steps steps;
        PieceParser(model, ParseEffort::Full).parse(piece, steps);
        expectSpells(model, piece, steps);
        ASSERT_EQ(costOf(model, steps), leastCost(model, piece, 0)) << text;
    }
}

TEST(PieceParserTest, LessEffortSpellsThePieceToo) {
    std::mt19937 random(29);
    std::uint64_t full = 0;
    std::uint64_t pruned = 0;
    std::uint64_t greedy = 0;
    for (int round = 0; round < 200; ++round) {
        const TokenModel model = randomModel(random);
        const std::string text = randomText(random, random() % 40);
        const Piece piece = pieceOf(text, NameStart);
        const auto parsedCost = [&](ParseEffort effort) {
            Steps steps;
            PieceParser(model, effort).parse(piece, steps);
            expectSpells(model, piece, steps);
            return costOf(model, steps);
        };
        full += parsedCost(ParseEffort::Full);
        pruned += parsedCost(ParseEffort::Pruned);
        greedy += parsedCost(ParseEffort::Greedy);
    }
    EXPECT_LE(full, pruned);
    EXPECT_LE(pruned, greedy);
    EXPECT_LE(pruned, full + full / 20);
}

TEST(PieceParserTest, UnknownBytesAreLiterals) {
    const TokenModel model({}, TokenUses(0), 1);
    for (const auto effort :
         {ParseEffort::Greedy, ParseEffort::Pruned, ParseEffort::Full}) {
        Steps steps;
        PieceParser(model, effort).parse(pieceOf("xyz", NameStart), steps);
        ASSERT_EQ(steps.size(), 4U);
        EXPECT_TRUE(steps[3].isLiteral());
        EXPECT_EQ(steps[3].value(), 0U);
        EXPECT_TRUE(steps[3].isLast());
    }
}

TEST(PieceParserTest, AppendsAndCanBeUsedAgain) {
    std::mt19937 random(31);
    const TokenModel model = randomModel(random);
    PieceParser parser(model, ParseEffort::Full);
    Steps steps;
    const std::string longText = randomText(random, 5000);
    parser.parse(pieceOf(longText, NameStart), steps);
    const std::size_t first = steps.size();
    parser.parse(pieceOf("ab", NameStart), steps);
    expectSpells(model, pieceOf(longText, NameStart),
                 Steps(steps.begin(),
                       steps.begin() + static_cast<std::ptrdiff_t>(first)));
    expectSpells(
        model, pieceOf("ab", NameStart),
        Steps(steps.begin() + static_cast<std::ptrdiff_t>(first), steps.end()));
}

}  // namespace
}  // namespace tessel::archive
