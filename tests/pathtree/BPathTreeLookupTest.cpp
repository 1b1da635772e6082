// Lookup in a path tree by position.

#include <gtest/gtest.h>

#include <stdexcept>

#include "pathtree/BPathTree.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::components;
using support::textsOf;
using tessel::BPathTree;
using tessel::Components;
using tessel::PathTrack;
using Names = std::vector<std::string>;
using Positions = std::vector<std::uint64_t>;

Names follow(const BPathTree& tree, const PathTrack& track) {
    Components out;
    tree.traversePath(track, out);
    return textsOf(out);
}

struct Lookup {
    std::vector<Names> folders;
    std::vector<Names> files;
    bool operator==(const Lookup&) const = default;
};

Lookup lookUp(const BPathTree& tree, const Positions& selected,
              const std::vector<PathTrack>& tracks,
              const std::vector<Positions>& offsets) {
    std::vector<Components> folders;
    std::vector<Components> files;
    tree.getPath(folders, files, selected, tracks, offsets);
    Lookup answer;
    for (const Components& folder : folders)
        answer.folders.push_back(textsOf(folder));
    for (const Components& names : files)
        answer.files.push_back(textsOf(names));
    return answer;
}

// ---- traversePath ----

TEST(PathTreeLookup, ATrackOfOnePositionIsAFirstLevelNode) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    addWhole(tree, {"c"});
    EXPECT_EQ(follow(tree, {1}), Names{"c"});
}

TEST(PathTreeLookup, ATrackMayEndAtAFolder) {
    BPathTree tree;
    addWhole(tree, {"a", "b", "c"});
    EXPECT_EQ(follow(tree, {0, 0}), (Names{"a", "b"}));
    EXPECT_EQ(follow(tree, {0, 0, 0}), (Names{"a", "b", "c"}));
}

TEST(PathTreeLookup, TraversePathKeepsWhatTheOutputHeld) {
    BPathTree tree;
    addWhole(tree, {"a"});
    Components out = components({"before"});
    tree.traversePath({0}, out);
    EXPECT_EQ(textsOf(out), (Names{"before", "a"}));
}

TEST(PathTreeLookup, AnEmptyTreeCannotBeTraversed) {
    const BPathTree tree;
    Components out = components({"before"});
    EXPECT_THROW(tree.traversePath({0}, out),
                 tessel::NoTreeToTraverseException);
    EXPECT_THROW(tree.traversePath({}, out), tessel::NoTreeToTraverseException);
    EXPECT_EQ(textsOf(out), Names{"before"});
}

TEST(PathTreeLookup, AnEmptyTrackCannotBeTraversed) {
    BPathTree tree;
    addWhole(tree, {"a"});
    Components out = components({"before"});
    EXPECT_THROW(tree.traversePath({}, out),
                 tessel::EmptyPathForTraverseException);
    EXPECT_EQ(textsOf(out), Names{"before"});
}

TEST(PathTreeLookup, ATrackThatLeadsOutsideIsOutOfRange) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    Components out = components({"before"});
    for (const PathTrack& track :
         {PathTrack{1}, PathTrack{0, 1}, PathTrack{0, 0, 0},
          PathTrack{BPathTree::allOnes}, PathTrack{0, BPathTree::allOnes}})
        EXPECT_THROW(tree.traversePath(track, out), std::out_of_range);
    EXPECT_EQ(textsOf(out), Names{"before"});
}

// ---- getPath ----

TEST(PathTreeLookup, ABatchThatCreatedItsFolder) {
    BPathTree tree;
    addWhole(tree, {"x"});
    addWhole(tree, {"y"});
    const auto added = addBatch(tree, {"a", "b"}, {"f", "g", "h"});
    ASSERT_EQ(added.track, (PathTrack{2, 0}));
    EXPECT_EQ(lookUp(tree, {0}, {added.track}, {{1, 3}}),
              (Lookup{{{"a", "b"}}, {{"f", "h"}}}));
}

TEST(PathTreeLookup, ABatchThatJoinedAStoredFolder) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"1", "2", "3", "4", "5"});
    auto added = addBatch(tree, {"a"}, {"6", "7", "8"});
    added.track.push_back(added.firstFile);
    ASSERT_EQ(added.track, (PathTrack{0, 5}));
    EXPECT_EQ(lookUp(tree, {0}, {added.track}, {{1, 2}}),
              (Lookup{{{"a"}}, {{"6", "7"}}}));
}

TEST(PathTreeLookup, APartitionSelectedTwiceIsAnsweredTwice) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    EXPECT_EQ(lookUp(tree, {0, 0}, {{0}}, {{2}, {2}}),
              (Lookup{{{"a"}, {"a"}}, {{"g"}, {"g"}}}));
}

TEST(PathTreeLookup, OffsetsBelongToTheSelectionNotToThePartition) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    addBatch(tree, {"b"}, {"h", "i"});
    EXPECT_EQ(lookUp(tree, {1, 0}, {{0}, {1}}, {{1}, {2, 1}}),
              (Lookup{{{"b"}, {"a"}}, {{"h"}, {"g", "f"}}}));
}

TEST(PathTreeLookup, NoOffsetsGiveAFolderAndNoFiles) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    EXPECT_EQ(lookUp(tree, {0}, {{0}}, {{}}), (Lookup{{{"a"}}, {{}}}));
}

TEST(PathTreeLookup, AFolderThatReceivedNoFilesIsTakenForAFile) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    const auto added = addBatch(tree, {"a", "b"}, {});
    ASSERT_EQ(added.track, (PathTrack{0, 1}));
    EXPECT_EQ(lookUp(tree, {0}, {added.track}, {{}}), (Lookup{{{"a"}}, {{}}}));
    EXPECT_EQ(lookUp(tree, {0}, {added.track}, {{1, 0}}),
              (Lookup{{{"a"}}, {{"b", "f"}}}));
}

TEST(PathTreeLookup, OutputsKeepWhatTheyHeld) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    std::vector<Components> folders = {components({"before"})};
    std::vector<Components> files = {components({"1"}), components({"2"})};
    tree.getPath(folders, files, {0}, std::vector<PathTrack>{{0}}, {{1}});
    ASSERT_EQ(folders.size(), 2U);
    EXPECT_EQ(textsOf(folders[0]), Names{"before"});
    EXPECT_EQ(textsOf(folders[1]), Names{"a"});
    ASSERT_EQ(files.size(), 3U);
    EXPECT_EQ(textsOf(files[1]), Names{"2"});
    EXPECT_EQ(textsOf(files[2]), Names{"f"});
}

TEST(PathTreeLookup, NothingSelectedChangesNothing) {
    const BPathTree tree;
    EXPECT_EQ(lookUp(tree, {}, {}, {}), Lookup{});
}

TEST(PathTreeLookup, AnEmptyTrackIsTheRootsBatch) {
    BPathTree tree;
    addBatch(tree, {}, {"f", "g"});
    EXPECT_EQ(lookUp(tree, {0}, {{}}, {{2, 1}}), (Lookup{{{}}, {{"g", "f"}}}));
}

TEST(PathTreeLookup, OneListForBothOutputsTakesFolderAndFilesInTurn) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    addBatch(tree, {"b"}, {"g"});
    std::vector<Components> both = {components({"before"})};
    tree.getPath(both, both, {0, 1}, std::vector<PathTrack>{{0}, {1}},
                 {{1}, {1}});
    ASSERT_EQ(both.size(), 5U);
    EXPECT_EQ(textsOf(both[0]), Names{"before"});
    EXPECT_EQ(textsOf(both[1]), Names{"a"});
    EXPECT_EQ(textsOf(both[2]), Names{"f"});
    EXPECT_EQ(textsOf(both[3]), Names{"b"});
    EXPECT_EQ(textsOf(both[4]), Names{"g"});
}

// Asks with outputs that hold something, which a refusal must not change.
void expectRefused(const BPathTree& tree, const Positions& selected,
                   const std::vector<PathTrack>& tracks,
                   const std::vector<Positions>& offsets) {
    std::vector<Components> folders = {components({"before"})};
    std::vector<Components> files = {components({"before"})};
    EXPECT_THROW(tree.getPath(folders, files, selected, tracks, offsets),
                 std::out_of_range);
    EXPECT_EQ(folders.size(), 1U);
    EXPECT_EQ(files.size(), 1U);
}

TEST(PathTreeLookup, PositionsThatLeadOutsideAreOutOfRange) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    const PathTrack folder = {0};
    expectRefused(tree, {1}, {folder}, {{1}});
    expectRefused(tree, {BPathTree::allOnes}, {folder}, {{1}});
    expectRefused(tree, {0}, {{1}}, {{}});
    expectRefused(tree, {0}, {{0, 2}}, {{}});
    expectRefused(tree, {0}, {{0, 0, 0}}, {{}});
    expectRefused(tree, {0}, {folder}, {{0}});
    expectRefused(tree, {0}, {folder}, {{3}});
    expectRefused(tree, {0}, {folder}, {{BPathTree::allOnes}});
    expectRefused(tree, {0, 0}, {folder}, {{1}, {1, 3}});
    expectRefused(tree, {0, 0}, {folder}, {{1}});
    expectRefused(BPathTree(), {0}, {{}}, {{}});
    expectRefused(BPathTree(), {0}, {{0}}, {{}});
}

TEST(PathTreeLookup, ALookupLeavesTheTreeAndThePassAlone) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    tree.reset();
    Components path;
    tree.getNextPath(path);
    lookUp(tree, {0}, {{0}}, {{1}});
    follow(tree, {0, 1});
    tree.getNextPath(path);
    EXPECT_EQ(textsOf(path), (Names{"a", "g"}));
    EXPECT_EQ(support::allPaths(tree), (Names{"a/f", "a/g"}));
}

}  // namespace
