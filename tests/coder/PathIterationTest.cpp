// Paths one after the other.

#include <gtest/gtest.h>

#include "coder/PathIteration.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::addBatch;
using support::addBatches;
using support::addWhole;
using support::CoderPtr;
using support::decodedBy;
using support::encodedBy;
using support::fourLetterCoder;
using support::Texts;
using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathIteration;

TEST(PathIteration, ResetStartsAgainFromTheFirstPath) {
    const CoderPtr coder = fourLetterCoder();
    addBatches(*coder, {{u"a"}, {u"b"}}, {{u"c", u"d"}, {u"c"}});
    const std::vector<Texts> expected = {
        {u"a", u"c"}, {u"a", u"d"}, {u"b", u"c"}};
    EXPECT_EQ(support::iterated(*coder), expected);
    EXPECT_FALSE(coder->hasNextPathFromBTree());
    EXPECT_EQ(support::iterated(*coder), expected);
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(coder->nextPathNumber, 1U);
    EXPECT_EQ(support::iterated(*coder), expected);
}

TEST(PathIteration, NoPathBeforeTheFirstReset) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b"});
    EXPECT_FALSE(coder->hasNextPathFromBTree());
    Components path;
    EXPECT_THROW(coder->getNextPathFromBTree(path),
                 tessel::NoMorePathException);
}

TEST(PathIteration, PastTheEndItThrows) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b"});
    support::iterated(*coder);
    Components path = {{1, 2, 3}};
    EXPECT_EQ(coder->nextPathNumber, 1U);
    EXPECT_THROW(coder->getNextPathFromBTree(path),
                 tessel::NoMorePathException);
    EXPECT_EQ(path, (Components{{1, 2, 3}}));
    EXPECT_EQ(coder->nextPathNumber, 2U);  // counted all the same
}

TEST(PathIteration, ARepeatedWholePathComesBackAtItsOwnNumber) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"c"});
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"d"});
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a", u"b"}, {u"c"}, {u"a", u"b"}, {u"d"}}));
}

TEST(PathIteration, ADuplicateIsLeftEvenWhenTheTreeHasNoFurtherPath) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a"});
    addWhole(*coder, {u"a"});
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    EXPECT_FALSE(coder->pathTree->hasNextPath());
    EXPECT_TRUE(coder->hasNextPathFromBTree());
    path.clear();
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(decodedBy(*coder, path), Texts{u"a"});
    EXPECT_FALSE(coder->hasNextPathFromBTree());
}

TEST(PathIteration, AStoredPathReplacesWhatTheListHeldADuplicateIsAppended) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a"});
    addWhole(*coder, {u"a"});
    coder->resetPathsToBTree();
    Components path = {{9}};
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(path, encodedBy(*coder, {u"a"}));
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(path, encodedBy(*coder, {u"a", u"a"}));
}

TEST(PathIteration, ResetClearsWhatWorkersLeftBehind) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> folders = {{u"a"}, {u"x"}};
    std::vector<Texts> files = {{u"b"}, {u"b"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, files),
                 tessel::CodeNotFoundException);
    coder->resetPathsToBTree();
    EXPECT_TRUE(coder->genThreads.empty());
    EXPECT_TRUE(coder->asyncFolders.empty());
    EXPECT_TRUE(coder->asyncFiles.empty());
    EXPECT_TRUE(coder->encodedFolders.empty());
    EXPECT_TRUE(coder->encodedFiles.empty());
}

// ---- Views ----

struct Seen {
    Components path;
    std::size_t unchangedFolders;
};

PathIteration passOf(HuffmanPathTree& coder) {
    return {*coder.pathTree, coder.numbering()};
}

Seen nextSeen(HuffmanPathTree& coder) {
    Seen seen;
    passOf(coder).visitNext([&seen](const tessel::PathView& path) {
        seen.path.assign(path.folders.begin(), path.folders.end());
        seen.path.emplace_back(path.name.begin(), path.name.end());
        seen.unchangedFolders = path.unchangedFolders;
    });
    return seen;
}

TEST(PathIteration, ViewsAreThoseOfThePathsInTurn) {
    const CoderPtr coder = fourLetterCoder();
    addBatches(*coder, {{u"a", u"b"}, {u"a", u"c"}}, {{u"c", u"d"}, {u"d"}});
    addWhole(*coder, {u"a", u"b", u"c"});  // number 4: a repeated one
    addWhole(*coder, {u"d"});
    const std::vector<Texts> paths = {{u"a", u"b", u"c"},
                                      {u"a", u"b", u"d"},
                                      {u"a", u"c", u"d"},
                                      {u"a", u"b", u"c"},
                                      {u"d"}};
    const std::size_t unchanged[] = {0, 2, 1, 0, 0};
    coder->resetPathsToBTree();
    for (std::size_t i = 0; i < paths.size(); ++i) {
        ASSERT_TRUE(coder->hasNextPathFromBTree());
        const Seen seen = nextSeen(*coder);
        EXPECT_EQ(decodedBy(*coder, seen.path), paths[i]);
        EXPECT_EQ(seen.unchangedFolders, unchanged[i]) << i;
    }
    EXPECT_THROW(nextSeen(*coder), tessel::NoMorePathException);
    EXPECT_EQ(coder->nextPathNumber, 6U);
}

// The tree knows nothing of the repeated path between two of one folder.
TEST(PathIteration, AfterARepeatedPathNoFolderIsUnchanged) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a", u"b", u"c"});
    addWhole(*coder, {u"a", u"b", u"c"});  // number 2
    addWhole(*coder, {u"a", u"b", u"d"});
    coder->resetPathsToBTree();
    nextSeen(*coder);
    EXPECT_EQ(nextSeen(*coder).unchangedFolders, 0U);
    const Seen third = nextSeen(*coder);
    EXPECT_EQ(decodedBy(*coder, third.path), (Texts{u"a", u"b", u"d"}));
    EXPECT_EQ(third.unchangedFolders, 0U);
}

TEST(PathIteration, AVisitorThatThrowsLeavesThePassBeforeThePath) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"c"});
    coder->resetPathsToBTree();
    const std::vector<Texts> paths = {{u"a", u"b"}, {u"a", u"b"}, {u"c"}};
    for (const Texts& path : paths) {
        const auto refuse = [](const tessel::PathView&) { throw 5; };
        EXPECT_THROW(passOf(*coder).visitNext(refuse), int);
        EXPECT_EQ(decodedBy(*coder, nextSeen(*coder).path), path);
    }
    EXPECT_FALSE(coder->hasNextPathFromBTree());
}

}  // namespace
