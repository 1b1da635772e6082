// Paths come out of a coder as bytes.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/CharacterCounter.hpp"
#include "paths/StoreReader.hpp"

namespace {

using namespace tessel::paths;
using tessel::DamagedFormException;
using tessel::HuffmanPathTree;
using Numbers = std::vector<std::size_t>;
using Strings = std::vector<std::string>;

std::unique_ptr<HuffmanPathTree> coderWith(HuffmanPathTree::FolderTexts folders,
                                           HuffmanPathTree::FolderTexts files) {
    CharacterCounter counter;
    counter.add(u"/abcd\xDC00\xD800");
    auto coder = coderFor(counter.result());
    coder->generateCodeAsyncAndAddPaths(folders, files);
    return coder;
}

// Folders that follow each other share none, some or all of their names.
std::unique_ptr<HuffmanPathTree> sampleCoder() {
    return coderWith({{u"/", u"a/", u"b/", u"c/"},
                      {u"/", u"a/"},
                      {u"/", u"a/", u"b/", u"c/"},
                      {u"/", u"a/", u"d/", u"c/"},
                      {u"a/"},
                      {u"\xDC00"},
                      {u"/", u"a/", u"d/"}},
                     {{u"a", u"b"},
                      {u"b"},
                      {u"cccc"},
                      {u"a"},
                      {u"\xDC00"},
                      {u"d"},
                      {u"a", u"\xDC00"}});
}

const Strings& samplePaths() {
    static const Strings paths = {"/a/b/c/a",    "/a/b/c/b", "/a/b",
                                  "/a/b/c/cccc", "/a/d/c/a", "a/",
                                  "d",           "/a/d/a",   "/a/d/"};
    return paths;
}

TEST(StoreReader, ReadsEveryRange) {
    const auto coder = sampleCoder();
    for (std::size_t first = 0; first <= samplePaths().size(); ++first)
        for (std::size_t last = first; last <= samplePaths().size(); ++last) {
            std::size_t next = first;
            tessel::paths::readPaths(
                *coder, first, last,
                [&](std::size_t number, std::string_view path) {
                    EXPECT_EQ(number, next++);
                    EXPECT_EQ(path, samplePaths()[number]);
                });
            EXPECT_EQ(next, last);
        }
}

TEST(StoreReader, ReadsEveryPairOfNumbers) {
    const auto coder = sampleCoder();
    for (std::size_t a = 0; a < samplePaths().size(); ++a)
        for (std::size_t b = 0; b < samplePaths().size(); ++b) {
            Strings met;
            tessel::paths::readPaths(*coder, Numbers{a, b},
                                     [&](std::size_t, std::string_view path) {
                                         met.emplace_back(path);
                                     });
            EXPECT_EQ(met, (Strings{samplePaths()[a], samplePaths()[b]}));
        }
}

TEST(StoreReader, ReadsOnePathAfterTheOther) {
    const auto coder = sampleCoder();
    const auto other = coderWith({{u"d/"}}, {{u"b"}});
    std::string text;
    for (std::size_t i = 0; i < samplePaths().size(); ++i) {
        readPath(*coder, i, text);
        EXPECT_EQ(text, samplePaths()[i]);
        readPath(*other, 0, text);
        EXPECT_EQ(text, "d/b");
    }
}

TEST(StoreReader, ReadsInTreeOrderAgainAndAgain) {
    const auto coder = sampleCoder();
    const Strings expected = {"/a/b/c/a", "/a/b/c/b", "/a/b/c/cccc",
                              "/a/b",     "/a/d/c/a", "/a/d/a",
                              "/a/d/",    "a/",       "d"};
    for (int pass = 0; pass < 2; ++pass) {
        Strings met;
        readInTreeOrder(*coder,
                        [&](std::string_view path) { met.emplace_back(path); });
        EXPECT_EQ(met, expected);
    }
}

TEST(StoreReader, APassThatWasLeftBeginsAnew) {
    const auto coder = sampleCoder();
    EXPECT_THROW(readInTreeOrder(*coder,
                                 [](std::string_view path) {
                                     if (path == "/a/b/c/cccc") throw 1;
                                 }),
                 int);
    std::size_t met = 0;
    readInTreeOrder(*coder, [&](std::string_view path) {
        EXPECT_FALSE(path.empty());
        ++met;
    });
    EXPECT_EQ(met, samplePaths().size());
}

TEST(StoreReader, WhatIsNoPathIsRefused) {
    const std::u16string lone(1, 0xD800);
    const std::u16string none(1, 0xDC00);
    const auto never = [](std::size_t, std::string_view) { FAIL(); };
    EXPECT_THROW(
        tessel::paths::readPaths(*coderWith({{lone}}, {{u"a"}}), 0, 1, never),
        DamagedFormException);
    EXPECT_THROW(
        tessel::paths::readPaths(*coderWith({{u"a"}}, {{lone}}), 0, 1, never),
        DamagedFormException);
    EXPECT_THROW(
        tessel::paths::readPaths(*coderWith({{none}}, {{none}}), 0, 1, never),
        DamagedFormException)
        << "an empty path";
}

TEST(StoreReader, NumbersThatLeadNowhereAreDamage) {
    const auto coder = sampleCoder();
    coder->partitionEnds.back() += 2;
    std::size_t visited = 0;
    const auto count = [&](std::size_t, std::string_view) { ++visited; };
    EXPECT_THROW(tessel::paths::readPaths(*coder, 0, 11, count),
                 DamagedFormException);
    EXPECT_EQ(visited, 9U);
    EXPECT_THROW(tessel::paths::readPaths(*coder, Numbers{20}, count),
                 DamagedFormException);
}

}  // namespace
