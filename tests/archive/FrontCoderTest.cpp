#include <gtest/gtest.h>

#include <numeric>
#include <string>

#include "archive/FrontCoder.hpp"

namespace tessel::archive {
namespace {

using Paths = std::vector<std::string>;

// A list and its codes, in the order given.
class Coded {
public:
    explicit Coded(const Paths& paths) : workers_(2, {}) {
        for (const std::string& path : paths) list_.add(SplitPath::of(path));
        coder_.emplace(list_,
                       Arrangement{ListOrder::AsGiven, list_.names(), {}, {}},
                       workers_);
    }
    const FrontCoder* operator->() const { return &*coder_; }
    std::string restOf(std::size_t place) const {
        const Piece piece = (*coder_).namePiece(place);
        return {piece.text, piece.length - 1};
    }

private:
    Workers workers_;
    SegmentList list_;
    std::optional<FrontCoder> coder_;
};

TEST(FrontCoderTest, NamesShareThePrefixOfTheirPredecessor) {
    const Coded coded({"d/abc", "d/abd", "d/xyz", "d/xy", "d/xyz"});
    EXPECT_EQ(coded->nameCode(0).operation, operationNextFolder);
    EXPECT_EQ(coded->nameCode(1).operation, 2);
    EXPECT_EQ(coded->nameCode(1).replaced, replacedContext('c'));
    EXPECT_EQ(coded.restOf(1), "d");
    EXPECT_EQ(coded->nameCode(2).operation, 0);
    EXPECT_EQ(coded.restOf(2), "xyz");
    EXPECT_EQ(coded->nameCode(3).prefix, 2U);
    EXPECT_FALSE(coded->hasPiece(3));
    EXPECT_EQ(coded->byteAfterPrefix(3), 0);
    EXPECT_EQ(coded->nameCode(4).replaced, replacedEnd);
}

TEST(FrontCoderTest, FoldersAreTheNextOrAJump) {
    const Coded coded({"a/1", "b/1", "a/2", "b/2", "c/1"});
    const auto operation = [&](std::size_t place) {
        return coded->nameCode(place).operation;
    };
    EXPECT_EQ(operation(0), operationNextFolder);
    EXPECT_EQ(operation(1), operationNextFolder);
    EXPECT_EQ(operation(2), operationJump);
    EXPECT_EQ(operation(3), operationJump);
    EXPECT_EQ(operation(4), operationNextFolder);
    // Distances 2 and 1 from the two folders seen.
    EXPECT_EQ(coded->counts().operations[jumpCode][1], 1U);
    EXPECT_EQ(coded->counts().operations[jumpCode][0], 1U);
}

TEST(FrontCoderTest, ABlockStartsWithoutPredecessor) {
    const Coded coded(Paths(40, "folder/name"));
    for (std::size_t place = 1; place < 40; ++place) {
        const bool first = place % FrontCoder::namesPerBlock == 0;
        EXPECT_EQ(coded->nameCode(place).prefix, first ? 0U : 4U) << place;
    }
    EXPECT_EQ(coded->counts().operations[firstInBlock][0], 2U);
}

TEST(FrontCoderTest, ABlockInAnEarlierFolderStartsWithAJump) {
    Paths paths = {"a/x", "b/x"};
    paths.resize(32, "a/y");
    const Coded coded(paths);
    EXPECT_EQ(coded->nameCode(16).operation, operationJump);
    EXPECT_EQ(coded->nameCode(17).prefix, 1U);
}

TEST(FrontCoderTest, LongPrefixesHaveTheirOwnSymbol) {
    const std::string stem(200, 's');
    const Coded coded({stem + "a", stem + "b", stem + "b/x", stem + "c/x"});
    EXPECT_EQ(coded->nameCode(1).prefix, 200U);
    EXPECT_EQ(coded->nameCode(1).operation, operationLongPrefix);
    // Folders: "", then the stem with b, then with c.
    EXPECT_EQ(coded->folderPrefix(1), 0U);
    EXPECT_EQ(coded->folderPrefix(2), 200U);
    EXPECT_EQ(coded->counts().operations[folderPrefixCode][operationLongPrefix],
              1U);
}

TEST(FrontCoderTest, FolderPiecesContinueTheirPrefix) {
    const Coded coded({"usr/lib/x", "usr/local/x", "usr/lo/x"});
    const Piece first = coded->folderPiece(0);
    EXPECT_EQ(std::string(first.text, first.length - 1), "usr/lib/");
    EXPECT_EQ(first.context, FolderStart);
    const Piece second = coded->folderPiece(1);
    EXPECT_EQ(std::string(second.text, second.length - 1), "ocal/");
    EXPECT_EQ(second.context, FolderInside);
    EXPECT_TRUE(second.folder);
}

TEST(FrontCoderTest, LongestPartsAreKnown) {
    const Coded coded({"a/bcd", "abcdef/g"});
    EXPECT_EQ(coded->maxNameBytes(), 3U);
    EXPECT_EQ(coded->maxFolderBytes(), 7U);
}

// Several chunks: each starts with the right number of folders.
TEST(FrontCoderTest, ChunksKnowTheFoldersBeforeThem) {
    Paths paths;
    for (std::size_t i = 0; i < 2 * FrontCoder::chunkItems + 5; ++i)
        paths.push_back(std::to_string(i / 3) + "/x");
    const Coded coded(paths);
    EXPECT_EQ(coded->seenBeforeChunk(0), 0U);
    EXPECT_EQ(coded->seenBeforeChunk(1), (FrontCoder::chunkItems + 2) / 3);
    std::uint64_t operations = 0;
    for (std::size_t c = 0; c < operationContextCount; ++c)
        operations =
            std::accumulate(coded->counts().operations[c].begin(),
                            coded->counts().operations[c].end(), operations);
    EXPECT_EQ(operations, paths.size());
    EXPECT_EQ(coded->counts().operations[jumpCode], FrontCounts::Row{});
}

}  // namespace
}  // namespace tessel::archive
