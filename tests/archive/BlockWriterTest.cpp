#include <gtest/gtest.h>

#include <numeric>
#include <optional>
#include <string>

#include "archive/BlockWriter.hpp"
#include "archive/ListParser.hpp"

namespace tessel::archive {
namespace {

using Paths = std::vector<std::string>;

// A list coded without any token: every byte is a literal.
class Literal {
public:
    explicit Literal(const Paths& paths)
        : workers_(1, {}), model_({}, TokenUses(0), 1) {
        for (const std::string& path : paths) list_.add(SplitPath::of(path));
        coder_.emplace(list_,
                       Arrangement{ListOrder::AsGiven, list_.names(), {}, {}},
                       workers_);
        parsed_ = parseList(*coder_, model_, ParseEffort::Full, workers_);
    }

    Blocks names() const {
        return BlockWriter(*coder_, codes(), tokens())
            .writeNames(0, parsed_.chunks[0]);
    }
    Blocks folders() const {
        return BlockWriter(*coder_, codes(), tokens())
            .writeFolders(0, parsed_.chunks[1]);
    }

private:
    const FrontCodes& codes() const {
        if (!codes_) codes_.emplace(coder_->counts());
        return *codes_;
    }
    const TokenCoder& tokens() const {
        if (!tokens_) tokens_.emplace(model_, parsed_.uses);
        return *tokens_;
    }

    Workers workers_;
    TokenModel model_;
    SegmentList list_;
    std::optional<FrontCoder> coder_;
    ParsedList parsed_;
    mutable std::optional<FrontCodes> codes_;
    mutable std::optional<TokenCoder> tokens_;
};

// Codes with one symbol take no bits, so the literals' bytes are all there is.
TEST(BlockWriterTest, NamesAreTheirBytesIfNothingElseIsPossible) {
    const Literal list({"ab", "ab"});
    const Blocks blocks = list.names();
    // "ab" and its end; the second name is a prefix of the first, at no cost.
    EXPECT_EQ(blocks.bytes, (std::vector<std::uint8_t>{'a', 'b', 0}));
    EXPECT_EQ(blocks.lengths, std::vector<std::uint32_t>{3});
    EXPECT_EQ(blocks.newFolders, std::vector<std::uint8_t>{1});
}

TEST(BlockWriterTest, BlocksAreAlignedAndCounted) {
    Paths paths;
    for (int i = 0; i < 40; ++i) {
        paths.emplace_back(1, static_cast<char>('a' + i / 4));
        paths.back() += '/';
        paths.back() += std::to_string(i);
    }
    const Literal list(paths);
    const Blocks names = list.names();
    EXPECT_EQ(names.lengths.size(), 3U);
    EXPECT_EQ(names.newFolders, (std::vector<std::uint8_t>{4, 4, 2}));
    EXPECT_EQ(std::accumulate(names.lengths.begin(), names.lengths.end(), 0U),
              names.bytes.size());
    const Blocks folders = list.folders();
    EXPECT_EQ(folders.lengths.size(), 2U);
    EXPECT_TRUE(folders.newFolders.empty());
    EXPECT_EQ(
        std::accumulate(folders.lengths.begin(), folders.lengths.end(), 0U),
        folders.bytes.size());
}

TEST(BlockWriterTest, LongPrefixesAreGammaCodes) {
    const std::string stem(124 + 5, 's');
    const Literal list({stem, stem, stem});
    const Blocks blocks = list.names();
    // After the first name: twice 00101, the number 5.
    const std::vector<std::uint8_t> end(blocks.bytes.end() - 2,
                                        blocks.bytes.end());
    EXPECT_EQ(blocks.bytes.size(), stem.size() + 1 + 2);
    EXPECT_EQ(end, (std::vector<std::uint8_t>{0b00101001, 0b01000000}));
}

}  // namespace
}  // namespace tessel::archive
