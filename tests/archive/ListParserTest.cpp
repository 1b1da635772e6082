#include <gtest/gtest.h>

#include <string>

#include "archive/ListParser.hpp"

namespace tessel::archive {
namespace {

// Names in a few folders, enough for two chunks, many of them alike.
class ListParserTest : public testing::Test {
protected:
    ListParserTest() {
        for (std::size_t i = 0; i < FrontCoder::chunkItems + 100; ++i) {
            std::string path(1, static_cast<char>('a' + i / 5000));
            path += "/name";
            path += std::to_string(i * 7 % 1000);
            list_.add(SplitPath::of(path));
        }
        std::vector<std::string> tokens = {"name", "1", "23"};
        TokenUses uses(3);
        for (std::uint32_t t = 0; t < 3; ++t)
            for (std::uint8_t c = 0; c < contextSlots; ++c)
                for (int n = 0; n < 10; ++n) uses.add(TokenRef::token(t, c));
        model_.emplace(tokens, uses, 1);
    }

    FrontCoder coded(Workers& workers) const {
        return FrontCoder(
            list_, Arrangement{ListOrder::AsGiven, list_.names(), {}, {}},
            workers);
    }

    SegmentList list_;
    std::optional<TokenModel> model_;
};

// The cache must give what the parser gives, chunk by chunk, in order.
TEST_F(ListParserTest, ChunksHoldTheStepsOfTheirPieces) {
    Workers workers(2, {});
    const FrontCoder coder = coded(workers);
    const ParsedList parsed =
        parseList(coder, *model_, ParseEffort::Pruned, workers);
    ASSERT_EQ(parsed.chunks.size(), 3U);
    PieceParser parser(*model_, ParseEffort::Pruned);
    std::vector<TokenRef> expected;
    TokenUses uses(model_->tokens().size());
    for (std::size_t place = 0; place < coder.names(); ++place)
        if (coder.hasPiece(place))
            parser.parse(coder.namePiece(place), expected);
    for (std::size_t number = 0; number < coder.folders(); ++number)
        parser.parse(coder.folderPiece(number), expected);
    std::size_t at = 0;
    for (const auto& chunk : parsed.chunks)
        for (const TokenRef step : chunk) {
            ASSERT_LT(at, expected.size());
            ASSERT_EQ(step.value(), expected[at].value());
            ASSERT_EQ(step.isLiteral(), expected[at].isLiteral());
            ASSERT_EQ(step.context(), expected[at].context());
            ASSERT_EQ(step.isLast(), expected[at].isLast());
            uses.add(step);
            ++at;
        }
    EXPECT_EQ(at, expected.size());
    for (std::size_t t = 0; t < model_->tokens().size(); ++t)
        for (std::size_t c = 0; c < contextSlots; ++c)
            EXPECT_EQ(parsed.uses.of(t, c), uses.of(t, c));
}

TEST_F(ListParserTest, ASampleIsDrawnEvenly) {
    Workers workers(1, {});
    const FrontCoder coder = coded(workers);
    const std::uint64_t all = coder.counts().pieceBytes;
    const auto bytesOf = [](const std::vector<Piece>& pieces) {
        std::uint64_t bytes = 0;
        for (const Piece& piece : pieces) bytes += piece.length;
        return bytes;
    };
    EXPECT_EQ(bytesOf(drawSample(coder, all)), all);
    EXPECT_EQ(bytesOf(drawSample(coder, 2 * all)), all);
    const auto tenth = drawSample(coder, all / 10);
    EXPECT_NEAR(static_cast<double>(bytesOf(tenth)),
                static_cast<double>(all) / 10, static_cast<double>(all) / 50);
    const auto again = drawSample(coder, all / 10);
    ASSERT_EQ(again.size(), tenth.size());
    for (std::size_t i = 0; i < tenth.size(); ++i)
        EXPECT_EQ(again[i].text, tenth[i].text);
}

TEST_F(ListParserTest, SampleUsesDoNotDependOnWorkers) {
    Workers one(1, {});
    Workers three(3, {});
    const FrontCoder coder = coded(one);
    const auto sample = drawSample(coder, 50'000);
    const auto a = parseSample(sample, *model_, ParseEffort::Full, one);
    const auto b = parseSample(sample, *model_, ParseEffort::Full, three);
    std::uint64_t total = 0;
    for (std::size_t t = 0; t < model_->tokens().size(); ++t)
        for (std::size_t c = 0; c < contextSlots; ++c) {
            EXPECT_EQ(a.of(t, c), b.of(t, c));
            total += a.of(t, c);
        }
    EXPECT_GT(total, 100U);
}

}  // namespace
}  // namespace tessel::archive
