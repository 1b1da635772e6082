// Insertion on the fast routes: packed batches, known folders, and its memory.

#include <gtest/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "pathtree/TreeInserter.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addWhole;
using support::allPaths;
using support::components;
using Paths = std::vector<std::string>;
using support::WholeAdded;
using tessel::BPathTree;
using tessel::ComponentArena;
using tessel::PathTrack;
using tessel::TreeInserter;

TEST(TreeInserter, APackedBatchIsAddedLikeVectors) {
    ComponentArena arena;
    const auto folder = support::packedBy(arena, components({"a", "b"}));
    const auto files = support::packedBy(arena, components({"f", ""}));
    BPathTree tree;
    PathTrack track;
    const TreeInserter::AddedBatch made =
        tree.inserter().addBatch(*tree.root, folder, files, track);
    EXPECT_FALSE(made.existed);
    EXPECT_EQ(made.firstFile, 0U);
    EXPECT_EQ(track, (PathTrack{0, 0}));
    const TreeInserter::AddedBatch found =
        tree.inserter().addBatch(*tree.root, folder, files, track);
    EXPECT_TRUE(found.existed);
    EXPECT_EQ(found.firstFile, 2U);
    EXPECT_TRUE(found.folder == made.folder);
    EXPECT_EQ(track, (PathTrack{0, 0, 0, 0}));
    EXPECT_EQ(tree.inserter().addFiles(made.folder, files), 4U);
    EXPECT_EQ(allPaths(tree),
              (Paths{"a/b/f", "a/b/", "a/b/f", "a/b/", "a/b/f", "a/b/"}));
}

TEST(TreeInserter, APackedFolderOfNoComponentsIsTheRoot) {
    ComponentArena arena;
    const auto files = support::packedBy(arena, components({"f"}));
    BPathTree tree;
    PathTrack track;
    for (const std::uint64_t first : {0U, 1U}) {
        const TreeInserter::AddedBatch added =
            tree.inserter().addBatch(*tree.root, {}, files, track);
        EXPECT_TRUE(added.folder == *tree.root);
        EXPECT_FALSE(added.existed);
        EXPECT_EQ(added.firstFile, first);
        EXPECT_TRUE(track.empty());
    }
    EXPECT_EQ(allPaths(tree), (Paths{"f", "f"}));
}

TEST(TreeInserter, ReleasingTheIndexSparesOneThatIsLarge) {
    BPathTree tree;
    for (std::size_t i = 0; i < 100; ++i)
        addWhole(tree, {support::numbered("d", i), "f"});
    tree.inserter().releaseIndex(50);
    EXPECT_GT(tree.inserter().indexBytes(), 100U);
    tree.inserter().releaseIndex(100);
    EXPECT_EQ(tree.inserter().indexBytes(), 0U);
    EXPECT_EQ(addWhole(tree, {"d57", "f"}), (WholeAdded{true, {57, 0}}));
}

TEST(TreeInserter, ANewRootForgetsTheFormerNodes) {
    BPathTree tree;
    for (std::size_t i = 0; i < 100; ++i)
        addWhole(tree, {support::numbered("d", i), "f"});
    tree.root = tree.inserter().makeRoot();
    EXPECT_EQ(tree.inserter().indexBytes(), 0U);
    EXPECT_TRUE(tree.root->value().empty());
    EXPECT_TRUE(tree.root->isLeaf());
    EXPECT_EQ(addWhole(tree, {"d57", "f"}), (WholeAdded{false, {}}));
}

}  // namespace
