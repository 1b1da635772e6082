// The face: whole paths, workers' remains, and its members.

#include <gtest/gtest.h>

#include "coder/HuffmanCode.hpp"
#include "coder/PathNumbering.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::CoderPtr;
using support::fourLetterCoder;
using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathTrack;
using Ends = std::vector<std::uint64_t>;

// ---- Whole paths ----

TEST(HuffmanPathTree, AWholePathAddedTwiceIsADuplicateTheSecondTime) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b"});
    support::addWhole(*coder, {u"a", u"b"});
    EXPECT_FALSE(coder->hasDuplicate(1));
    EXPECT_TRUE(coder->hasDuplicate(2));
    EXPECT_FALSE(coder->hasDuplicate(3));
    ASSERT_EQ(coder->duplicates.size(), 1U);
    EXPECT_EQ(coder->duplicates.at(2), (PathTrack{0, 0}));
    EXPECT_EQ(coder->pathCount, 2U);
    EXPECT_EQ(coder->maxDuplicateTrackLength, 2U);
    EXPECT_EQ(coder->maxDuplicatePathNumber, 2U);
    EXPECT_TRUE(coder->partitionEnds.empty());
}

TEST(HuffmanPathTree, ANewWholePathIsCountedAndNoDuplicate) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b"});
    support::addWhole(*coder, {u"a", u"c"});
    EXPECT_TRUE(coder->duplicates.empty());
    EXPECT_EQ(coder->maxDuplicatePathNumber, 0U);
    EXPECT_EQ(coder->maxDuplicateTrackLength, 0U);
    EXPECT_EQ(coder->pathCount, 2U);
}

TEST(HuffmanPathTree, TheLongestDuplicateTrackIsRemembered) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b", u"c"});
    support::addWhole(*coder, {u"a", u"b", u"c"});
    support::addWhole(*coder, {u"a", u"b"});
    EXPECT_EQ(coder->duplicates.at(3), (PathTrack{0, 0}));
    EXPECT_EQ(coder->maxDuplicateTrackLength, 3U);
    EXPECT_EQ(coder->maxDuplicatePathNumber, 3U);
}

TEST(HuffmanPathTree, AWholePathOfNoComponentsIsStillCounted) {
    const CoderPtr coder = fourLetterCoder();
    Components none;
    coder->addPathToBTree(none);
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_TRUE(coder->duplicates.empty());
}

TEST(HuffmanPathTree, APartitionOfRawComponentsIsMovedIn) {
    const CoderPtr coder = fourLetterCoder();
    Components folder = {{0x00, 2}};
    Components files = {{0x01, 2}, {0x02, 2}};
    coder->addPathToBTree(folder, files);
    EXPECT_EQ(folder, (Components{{}}));
    EXPECT_EQ(files, (Components{{}, {}}));
    EXPECT_EQ(coder->partitionEnds, (Ends{2}));
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

// ---- Workers' remains ----

TEST(HuffmanPathTree, ClearingWithoutWorkersDoesNothing) {
    const CoderPtr coder = fourLetterCoder();
    coder->joinAllGenThreads();
    coder->clearThreadResources();
    support::addBatch(*coder, {u"a"}, {u"b"});
    coder->joinAllGenThreads();
    coder->clearThreadResources();
    EXPECT_EQ(coder->pathCount, 1U);
}

TEST(HuffmanPathTree, JoiningWaitsForTheThreadsAndForgetsThem) {
    const CoderPtr coder = fourLetterCoder();
    bool done = false;
    coder->genThreads.emplace_back([&done] { done = true; });
    coder->genThreads.emplace_back();  // not joinable
    coder->joinAllGenThreads();
    EXPECT_TRUE(done);
    EXPECT_TRUE(coder->genThreads.empty());
}

TEST(HuffmanPathTree, ResetJoinsWorkers) {
    const CoderPtr coder = fourLetterCoder();
    bool done = false;
    coder->genThreads.emplace_back([&done] { done = true; });
    coder->resetPathsToBTree();
    EXPECT_TRUE(coder->genThreads.empty());
    EXPECT_TRUE(done);
}

TEST(HuffmanPathTree, ABatchJoinsTheWorkersOfTheOneBefore) {
    const CoderPtr coder = fourLetterCoder();
    bool done = false;
    coder->genThreads.emplace_back([&done] { done = true; });
    support::addBatch(*coder, {u"a"}, {u"b"});
    EXPECT_TRUE(coder->genThreads.empty());
    EXPECT_TRUE(done);
}

TEST(HuffmanPathTree, TheDestructorJoinsWorkers) {
    bool done = false;
    {
        const CoderPtr coder = fourLetterCoder();
        coder->genThreads.emplace_back([&done] { done = true; });
    }
    EXPECT_TRUE(done);
}

// ---- The members ----

TEST(HuffmanPathTree, ItsMembersAreThoseOfItsParts) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b", u"c"});
    EXPECT_EQ(coder->pathCount, coder->numbering().pathCount);
    EXPECT_EQ(coder->partitionEnds[0], 2U);
    EXPECT_EQ(&coder->partitionEnds, &coder->numbering().partitionEnds);
    EXPECT_EQ(&coder->nodes, &coder->code().nodes);
    coder->resetPathsToBTree();
    EXPECT_EQ(coder->pathTree->pendingNodes.size(), 1U);
    coder->folderResultMutex.lock();
    EXPECT_TRUE(coder->fileResultMutex.try_lock());
    coder->fileResultMutex.unlock();
    coder->folderResultMutex.unlock();
}

TEST(HuffmanPathTree, ACopysMembersAreItsOwn) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b"});
    HuffmanPathTree copy;
    copy.copyTree(*coder);
    support::addBatch(copy, {u"a"}, {u"c"});
    EXPECT_EQ(copy.pathCount, 2U);
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_EQ(&copy.pathCount, &copy.numbering().pathCount);
}

// ---- What insertion remembers ----

TEST(HuffmanPathTree, ABatchOfManyFoldersReleasesWhatItSearchedWith) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<support::Texts> folders;
    for (std::size_t i = 1; i <= 50; ++i)
        folders.push_back({std::u16string(i, u'a')});
    support::addBatches(*coder, folders, {50, support::Texts{u"b"}});
    EXPECT_EQ(coder->pathTree->memoryUsage().childIndex, 0U);
}

TEST(HuffmanPathTree, ABatchOfFewFoldersKeepsALargeIndexForTheNext) {
    const CoderPtr coder = fourLetterCoder();
    for (std::size_t i = 1; i <= 50; ++i)
        support::addWhole(*coder, {std::u16string(i, u'a'), u"b"});
    support::addBatch(*coder, {u"c"}, {u"b"});
    EXPECT_GT(coder->pathTree->memoryUsage().childIndex, 50 * 8U);
}

}  // namespace
