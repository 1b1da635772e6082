// Lists as batches for the coder, and its texts as paths again.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "paths/Batches.hpp"
#include "tests/paths/Lists.hpp"

namespace {

using support::listOf;
using namespace tessel::paths;

TEST(Batches, ConsecutiveFilesOfAFolderAreOneEntry) {
    const PathList list =
        listOf({"/u/a", "/u/b", "/u/x/c", "/u/d", "v/e", "/u/x", "/u"});
    const PathSplitter splitter(list);
    BatchReader reader(splitter);
    Batch batch;
    ASSERT_TRUE(reader.next(batch));
    EXPECT_EQ(batch.pathCount, 7U);
    EXPECT_EQ(
        batch.folders,
        (FolderTexts{
            {u"/u/"}, {u"/u/", u"x"}, {u"/u/"}, {u"v/"}, {u"/u"}, {u"/"}}));
    EXPECT_EQ(
        batch.files,
        (FolderTexts{{u"a", u"b"}, {u"c"}, {u"d"}, {u"e"}, {u"/x"}, {u"u"}}));
    EXPECT_FALSE(reader.next(batch));
    EXPECT_TRUE(batch.folders.empty());
    EXPECT_EQ(batch.pathCount, 0U);
}

TEST(Batches, ABatchEndsOnlyWhereTheFolderChanges) {
    const PathList list =
        listOf({"/u/a", "/u/b", "/u/c", "/v/a", "/w/a", "/w/b"});
    const PathSplitter splitter(list);
    BatchReader reader(splitter, 2);
    Batch batch;
    std::vector<std::size_t> sizes;
    while (reader.next(batch)) sizes.push_back(batch.pathCount);
    EXPECT_EQ(sizes, (std::vector<std::size_t>{3, 3}));
}

TEST(Batches, OneCharacterMoreInTheRootIsAnotherFolder) {
    // Both roots' text and both folders' text are "ab/": the cut differs.
    const PathSplit one{3, 3};
    const PathSplit other{2, 3};
    EXPECT_FALSE(sameFolder("ab/x", one, "ab/y", other));
    EXPECT_TRUE(sameFolder("ab/x", one, "ab/y", one));
    EXPECT_FALSE(sameFolder("ab/x", one, "ac/y", one));
}

TEST(Batches, CharactersAreCountedByComponent) {
    const PathList list = listOf({"/aa/b", "/aa/c", "d", "/aa/b"});
    const PathSplitter splitter(list);
    const CharacterCounts counts = countCharacters(splitter);
    EXPECT_EQ(counts.characters, u"/abcd\xDC00");
    EXPECT_EQ(counts.frequencies, (std::vector<double>{2, 4, 2, 1, 1, 1}));

    Batch batch;
    ASSERT_TRUE(BatchReader(splitter).next(batch));
    const CharacterCounts same = countCharacters(batch.folders, batch.files);
    EXPECT_EQ(same.characters, counts.characters);
    EXPECT_EQ(same.frequencies, counts.frequencies);
}

TEST(Batches, JoinedTextsGiveThePathBack) {
    std::u16string text;
    appendFolder({u"/", u"usr", u"bin"}, text);
    EXPECT_EQ(text, u"/usr/bin/");
    text.clear();
    appendFolder({u"/"}, text);
    EXPECT_EQ(text, u"/");

    std::string path;
    EXPECT_TRUE(textToPath(std::u16string(1, noRoot) + u'a', path));
    EXPECT_EQ(path, "a");
    EXPECT_FALSE(textToPath(std::u16string(u"a") + noRoot, path));
    EXPECT_EQ(path, "a");
}

}  // namespace
