// Paths as the coder inserts them, on any number of threads.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/ChunkEncoder.hpp"
#include "tests/paths/Lists.hpp"

namespace {

using support::listOf;
using namespace tessel::paths;
using tessel::ComponentList;
using tessel::ComponentView;
using tessel::HuffmanPathTree;
using Texts = std::vector<std::vector<std::u16string>>;

// A coder for all characters of the paths.
std::unique_ptr<HuffmanPathTree> coderOf(const PathList& paths) {
    CharacterCounter counter;
    counter.add(0xDC00);
    for (std::size_t i = 0; i < paths.size(); ++i) counter.addBytes(paths[i]);
    return coderFor(counter.result());
}

Texts textsOf(const HuffmanPathTree& coder,
              const std::vector<ComponentList>& lists) {
    Texts texts;
    for (const ComponentList& list : lists) {
        texts.emplace_back();
        for (const ComponentView component : list)
            coder.appendPathFrom(component, texts.back().emplace_back());
    }
    return texts;
}

PathList manyPaths() {
    PathList list;
    for (std::size_t i = 0; i < 20'000; ++i)
        list.append("top/" + std::to_string(i / 37) + "/name" +
                    std::to_string(i));
    return list;
}

TEST(ChunkEncoder, ARunOfPathsOfOneFolderIsOneEntry) {
    const PathList paths =
        listOf({"/a/b", "/a/c", "d", "e", "/a/b", "/a/b/", "/"});
    const auto coder = coderOf(paths);
    const EncodedChunk chunk = encodeChunk(coder->code(), paths, 1);
    const std::u16string none(1, 0xDC00);
    EXPECT_EQ(textsOf(*coder, chunk.folders), (Texts{{u"/", u"a/"},
                                                     {none},
                                                     {u"/", u"a/"},
                                                     {u"/", u"a/", u"b/"},
                                                     {u"/"}}));
    EXPECT_EQ(textsOf(*coder, chunk.files),
              (Texts{{u"b", u"c"}, {u"d", u"e"}, {u"b"}, {none}, {none}}));
}

TEST(ChunkEncoder, TheThreadsDoNotShow) {
    const PathList paths = manyPaths();
    const auto coder = coderOf(paths);
    const EncodedChunk one = encodeChunk(coder->code(), paths, 1);
    for (const unsigned threads : {0U, 2U, 3U, 7U, 100U}) {
        const EncodedChunk some = encodeChunk(coder->code(), paths, threads);
        EXPECT_EQ(textsOf(*coder, some.folders), textsOf(*coder, one.folders));
        EXPECT_EQ(textsOf(*coder, some.files), textsOf(*coder, one.files));
        EXPECT_EQ(some.maxComponentBytes, one.maxComponentBytes);
    }
}

TEST(ChunkEncoder, OneFolderIsNotDivided) {
    PathList paths;
    for (std::size_t i = 0; i < 5'000; ++i)
        paths.append("a/" + std::to_string(i));
    const auto coder = coderOf(paths);
    const EncodedChunk chunk = encodeChunk(coder->code(), paths, 4);
    EXPECT_EQ(chunk.folders.size(), 1U);
    ASSERT_EQ(chunk.files.size(), 1U);
    EXPECT_EQ(chunk.files[0].size(), 5'000U);
}

TEST(ChunkEncoder, NothingGivesNothing) {
    const auto coder = coderOf(listOf({"ab"}));
    const EncodedChunk chunk = encodeChunk(coder->code(), PathList(), 4);
    EXPECT_TRUE(chunk.folders.empty());
    EXPECT_TRUE(chunk.files.empty());
    EXPECT_EQ(chunk.maxComponentBytes, 0U);
}

TEST(ChunkEncoder, TheLongestComponentIsKnown) {
    const PathList paths = listOf({"a/b", "a/bbbbbbbbbbbbbbbb", "abababab/a"});
    const auto coder = coderOf(paths);
    std::size_t longest = 0;
    const EncodedChunk chunk = encodeChunk(coder->code(), paths, 1);
    for (const auto* lists : {&chunk.folders, &chunk.files})
        for (const ComponentList& list : *lists)
            for (const ComponentView component : list)
                longest = std::max(longest, component.size());
    EXPECT_EQ(chunk.maxComponentBytes, longest);
}

TEST(ChunkEncoder, ACharacterWithoutACodeIsRefusedOnAnyThread) {
    PathList paths = manyPaths();
    const auto coder = coderOf(paths);
    paths.append("top/x?");
    for (const unsigned threads : {1U, 4U})
        EXPECT_THROW(encodeChunk(coder->code(), paths, threads),
                     tessel::CodeNotFoundException);
}

}  // namespace
