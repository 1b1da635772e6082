// Chunks that are encoded beside the insertion, with and without a thread.

#include <gtest/gtest.h>

#include <string>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/StoreAppender.hpp"
#include "paths/StoreReader.hpp"
#include "tests/support/FewThreads.hpp"

namespace {

using tessel::paths::StoreAppender;

TEST(StoreAppenderThreads, ChunksAreAddedInOrderOnAsManyThreadsAsThereAre) {
    const std::string big(StoreAppender::maxBytesPerChunk / 2, 'a');
    for (const int possible : {0, 1, 2, 100}) {
        const auto coder = tessel::paths::coderFor(
            {u"/012345a\xDC00", std::vector<double>(9, 1)});
        const support::FewThreads few(possible);
        StoreAppender appender(*coder);
        for (int i = 0; i < 6; ++i) appender.add(big + std::to_string(i));
        EXPECT_EQ(coder->pathCount, 4U);
        appender.finish();
        ASSERT_EQ(coder->pathCount, 6U);
        std::string text;
        for (std::size_t i = 0; i < 6; ++i) {
            tessel::paths::readPath(*coder, i, text);
            EXPECT_EQ(text, big + std::to_string(i));
        }
    }
}

}  // namespace
