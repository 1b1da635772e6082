// What is known of the folders of tracks, near and far, and of which tree.

#include <gtest/gtest.h>

#include "coder/FolderShortcuts.hpp"
#include "coder/PathTracks.hpp"
#include "pathtree/NodePool.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::CoderPtr;
using support::component;
using support::fourLetterCoder;
using tessel::BNode;
using tessel::BNodePtr;
using tessel::FolderNode;
using tessel::FolderShortcuts;
using tessel::NodePool;
using tessel::PathTracks;

class FolderShortcutsTest : public testing::Test {
protected:
    FolderNode& root() { return *root_->folder(); }
    // Notes a folder so many steps behind the root; nobody looks into it.
    void note(std::size_t k, std::int64_t steps, bool isEnd) {
        shortcuts.reserveFor(k);
        shortcuts.note(k, *root_, {root().atSteps(steps), isEnd});
    }
    void expect(std::size_t k, std::int64_t steps, bool isEnd) {
        const auto [folder, found] = shortcuts.find(k, &root());
        EXPECT_EQ(folder, root().atSteps(steps)) << k;
        EXPECT_EQ(found, isEnd) << k;
    }
    bool knows(std::size_t k) {
        return shortcuts.find(k, &root()).folder != nullptr;
    }

    FolderShortcuts shortcuts;

private:
    NodePool pool_;
    BNodePtr root_ = BNodePtr::adopt(pool_.make({}, {}));
};

TEST_F(FolderShortcutsTest, NothingIsKnownAtFirst) {
    EXPECT_FALSE(knows(0));
    EXPECT_FALSE(knows(~std::size_t{0}));
    EXPECT_EQ(shortcuts.memoryBytes(), 0U);
    note(0, 5, true);
    EXPECT_EQ(shortcuts.find(0, nullptr).folder, nullptr);
}

TEST_F(FolderShortcutsTest, AFolderIsFoundOnEitherSideOfTheRoot) {
    constexpr std::int64_t furthest = (std::int64_t{1} << 30) - 1;
    std::size_t k = 0;
    for (const std::int64_t steps :
         {std::int64_t{1}, std::int64_t{-1}, std::int64_t{1000},
          std::int64_t{-1000}, furthest, -furthest})
        for (const bool isEnd : {true, false}) {
            note(k, steps, isEnd);
            expect(k, steps, isEnd);
            ++k;
        }
    note(k, 0, true);
    expect(k, 0, true);
}

TEST_F(FolderShortcutsTest, WhatIsTooFarIsNotKnown) {
    constexpr std::int64_t tooFar = std::int64_t{1} << 30;
    std::size_t k = 0;
    for (const std::int64_t steps :
         {tooFar, -tooFar, 8 * tooFar, -8 * tooFar}) {
        note(k, steps, true);
        EXPECT_FALSE(knows(k)) << steps;
        ++k;
    }
}

TEST_F(FolderShortcutsTest, TracksThatWereLeftOutAreNotKnown) {
    note(3, 5, true);
    for (const std::size_t k : {0U, 1U, 2U, 4U}) EXPECT_FALSE(knows(k)) << k;
    expect(3, 5, true);
    note(1, 7, false);  // what was known of later tracks is forgotten
    expect(1, 7, false);
    EXPECT_FALSE(knows(3));
}

TEST_F(FolderShortcutsTest, AnotherRootKnowsNothing) {
    note(0, 5, true);
    NodePool pool;
    const BNodePtr other = BNodePtr::adopt(pool.make({}, {}));
    EXPECT_EQ(shortcuts.find(0, other->folder()).folder, nullptr);
    shortcuts.note(0, *other, {other->folder()->atSteps(9), true});
    EXPECT_FALSE(knows(0));
    EXPECT_EQ(shortcuts.find(0, other->folder()).folder,
              other->folder()->atSteps(9));
}

// ---- In a coder ----

TEST(FolderShortcuts, ACoderKnowsTheFoldersThatItAdded) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a", u"b"}, {u"c"});
    addBatch(*coder, {u"a"}, {u"c", u"d"});
    addBatch(*coder, {}, {u"d"});
    const PathTracks& tracks = coder->partitionTracks;
    const FolderNode* const root = coder->pathTree->root->folder();
    ASSERT_NE(tracks.folders().find(0, root).folder, nullptr);
    EXPECT_TRUE(tracks.folders().find(0, root).isEnd);
    ASSERT_NE(tracks.folders().find(1, root).folder, nullptr);
    EXPECT_FALSE(tracks.folders().find(1, root).isEnd);
    EXPECT_EQ(tracks.folders().find(0, root).folder->parent(),
              tracks.folders().find(1, root).folder);
    EXPECT_EQ(tracks.folders().find(2, root).folder, nullptr);
    EXPECT_EQ(support::brokenInvariant(*coder), "");
}

TEST(FolderShortcuts, ARestoredCoderAndACopyKnowThemToo) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a", u"b"}, {u"c"});
    addBatch(*coder, {u"a"}, {u"c", u"d"});
    addBatch(*coder, {u"a", u"b"}, {u"d"});
    const CoderPtr back =
        support::restoredFrom(support::formOf(*coder, false), false, *coder);
    tessel::HuffmanPathTree copy;
    copy.copyTree(*coder);
    for (const tessel::HuffmanPathTree* known : {back.get(), &copy}) {
        const FolderNode* const root = known->pathTree->root->folder();
        for (std::size_t k = 0; k < 3; ++k)
            EXPECT_NE(known->partitionTracks.folders().find(k, root).folder,
                      nullptr)
                << k;
        EXPECT_EQ(support::brokenInvariant(*known), "");
    }
}

TEST(FolderShortcuts, AnotherPathTreeIsSearchedByItsTracks) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a", u"b"}, {u"c"});
    const CoderPtr other = fourLetterCoder();
    addBatch(*other, {u"d", u"d"}, {u"b"});
    coder->pathTree = std::move(other->pathTree);
    const auto answer = support::found(*coder, {1});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*coder, answer->folders[0]),
              (support::Texts{u"d", u"d"}));
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]),
              (support::Texts{u"b"}));
}

// A file that the batch began with becomes a folder: the number then leads
// into it, as its track says.
TEST(FolderShortcuts, AFirstFileThatBecameAFolderIsEntered) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"c"});
    addBatch(*coder, {u"a"}, {u"d"});
    addBatch(*coder, {u"a", u"d"}, {u"bb"});
    const auto before = support::found(*coder, {2});
    coder->partitionTracks.forgetFolders();
    const auto after = support::found(*coder, {2});
    ASSERT_TRUE(before && after);
    EXPECT_EQ(before->folders, after->folders);
    EXPECT_EQ(before->files, after->files);
    EXPECT_EQ(support::decodedBy(*coder, before->files[0]),
              (support::Texts{u"bb"}));
}

}  // namespace
