// Paths reach the coder in chunks, in order.

#include <gtest/gtest.h>

#include <string>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/StoreAppender.hpp"
#include "paths/StoreReader.hpp"

namespace {

using namespace tessel::paths;
using tessel::HuffmanPathTree;

std::unique_ptr<HuffmanPathTree> smallCoder() {
    return coderFor({u"/0123456789ab\xDC00", std::vector<double>(14, 1)});
}

TEST(StoreAppender, NothingIsAddedBeforeTheEnd) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder);
    appender.add("a/1");
    appender.add("b");
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_FALSE(appender.hasStarted());
    appender.finish();
    EXPECT_TRUE(appender.hasStarted());
    EXPECT_EQ(appender.pathCount(), 2U);
    EXPECT_EQ(coder->pathCount, 2U);
    appender.finish();
    EXPECT_EQ(coder->pathCount, 2U);
}

// A full chunk waits until the next one is full or the end is there.
TEST(StoreAppender, FullChunksAreAddedInOrder) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder, 4);
    for (int i = 0; i < 7; ++i) appender.add("a/" + std::to_string(i));
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_FALSE(appender.hasStarted());
    appender.add("a/7");
    EXPECT_EQ(coder->pathCount, 4U);
    EXPECT_TRUE(appender.hasStarted());
    appender.add("b");
    appender.finish();
    EXPECT_EQ(appender.pathCount(), 9U);
    ASSERT_EQ(coder->pathCount, 9U);
    std::string text;
    for (std::size_t i = 0; i < 8; ++i) {
        readPath(*coder, i, text);
        EXPECT_EQ(text, "a/" + std::to_string(i));
    }
    readPath(*coder, 8, text);
    EXPECT_EQ(text, "b");
}

TEST(StoreAppender, LongPathsFillAChunkToo) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder);
    const std::string big(StoreAppender::maxBytesPerChunk, 'a');
    appender.add(big + "0");
    appender.add(big + "1");
    EXPECT_EQ(coder->pathCount, 1U);
    appender.finish();
    EXPECT_EQ(coder->pathCount, 2U);
    std::string text;
    readPath(*coder, 1, text);
    EXPECT_EQ(text, big + "1");
}

TEST(StoreAppender, ARefusedChunkLeavesTheOneBefore) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder, 1);
    appender.add("a");
    EXPECT_THROW(appender.add("?"), tessel::CodeNotFoundException);
    EXPECT_TRUE(appender.hasStarted());
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_TRUE(coder->encodedFolders.empty());
}

TEST(StoreAppender, ARefusedChunkLeavesTheCoder) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder);
    appender.add("a");
    appender.add("?");
    EXPECT_THROW(appender.finish(), tessel::CodeNotFoundException);
    EXPECT_FALSE(appender.hasStarted());
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_TRUE(coder->encodedFolders.empty());
}

TEST(StoreAppender, TheCoderKnowsItsLongestComponent) {
    const auto coder = smallCoder();
    StoreAppender appender(*coder);
    appender.add("a/bbbbbbbbbbbbbbbbbbbbbb");
    appender.finish();
    EXPECT_EQ(coder->maxCodeBytes,
              coder->generateCodeFor(u"bbbbbbbbbbbbbbbbbbbbbb").size());
}

}  // namespace
