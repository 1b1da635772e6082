// What happens when the platform gives no more threads.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "coder/HuffmanCode.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/ChunkEncoder.hpp"
#include "tests/support/FewThreads.hpp"

namespace {

using tessel::Component;
using tessel::paths::CharacterCounter;
using tessel::paths::encodeChunk;
using tessel::paths::EncodedChunk;
using tessel::paths::PathList;

// Enough for several threads, with a folder for each hundred paths.
PathList manyPaths() {
    PathList paths;
    for (std::size_t i = 0; i < 8'000; ++i)
        paths.append("folder" + std::to_string(i / 100) + "/" +
                     std::to_string(i));
    return paths;
}

std::vector<Component> contentOf(const EncodedChunk& chunk) {
    std::vector<Component> content;
    for (const auto* lists : {&chunk.folders, &chunk.files})
        for (const tessel::ComponentList& list : *lists)
            content.emplace_back(list.bytes().begin(), list.bytes().end());
    return content;
}

TEST(ChunkEncoderThreads, PartsWithoutAThreadAreEncodedAllTheSame) {
    const PathList paths = manyPaths();
    CharacterCounter counter;
    counter.addBytes("folder/0123456789");
    const auto coder = tessel::paths::coderFor(counter.result());
    const auto all = contentOf(encodeChunk(coder->code(), paths, 4));
    ASSERT_EQ(all.size(), 160U);
    for (int possible = 0; possible < 4; ++possible) {
        const support::FewThreads few(possible);
        EXPECT_EQ(contentOf(encodeChunk(coder->code(), paths, 4)), all);
    }
}

}  // namespace
