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
    for (const int possible : {0, 1, 2, 100}) {
        const auto coder = tessel::paths::coderFor(
            {u"/012345a\xDC00", std::vector<double>(9, 1)});
        const support::FewThreads few(possible);
        constexpr std::size_t chunk = 3000;  // worth more than one thread
        constexpr std::size_t count = 3 * chunk;
        const auto path = [](std::size_t i) {
            return std::to_string(i % 6) + "/a" + std::to_string(i % 5);
        };
        StoreAppender appender(*coder, chunk);
        for (std::size_t i = 0; i < count; ++i) appender.add(path(i));
        EXPECT_EQ(coder->pathCount, 2 * chunk);
        appender.finish();
        ASSERT_EQ(coder->pathCount, count);
        std::string text;
        for (std::size_t i = 0; i < count; ++i) {
            tessel::paths::readPath(*coder, i, text);
            ASSERT_EQ(text, path(i));
        }
    }
}

}  // namespace
