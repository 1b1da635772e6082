// One insertion, kept or taken back.

#include <gtest/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "pathtree/Insertion.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::component;
using tessel::BPathTree;
using tessel::ChildIndex;
using tessel::Insertion;
using tessel::NodePool;
using tessel::PathTrack;
using Kind = NodePool::Kind;
using Paths = std::vector<std::string>;

struct Tree {
    BPathTree tree;
    NodePool pool;
    ChildIndex index;
    PathTrack track = {77};

    Tree() {
        for (std::size_t i = 0; i < 12; ++i)
            support::addWhole(tree, {support::numbered("d", i), "f"});
    }
    void enter(Insertion& insertion, const Paths& names) {
        for (const std::string& name : names)
            track.push_back(insertion.enter(component(name), Kind::folder));
    }
};

TEST(Insertion, FindsWhatIsThereAndMakesWhatIsNot) {
    Tree one;
    {
        Insertion insertion(*one.tree.root, one.pool, one.index, one.track);
        EXPECT_EQ(&insertion.node(), one.tree.root.get());
        EXPECT_FALSE(insertion.existed());
        one.enter(insertion, {"d7", "f"});
        EXPECT_TRUE(insertion.existed());
        one.enter(insertion, {"x"});
        EXPECT_FALSE(insertion.existed());
        EXPECT_EQ(support::textOf(insertion.node().value()), "x");
        insertion.commit();
    }
    EXPECT_EQ(one.track, (PathTrack{77, 7, 0, 0}));
    EXPECT_EQ(support::addWhole(one.tree, {"d7", "f", "x"}),
              (support::WholeAdded{true, {7, 0, 0}}));
}

TEST(Insertion, TakesBackAllThatItMadeUnlessItIsCommitted) {
    Tree one;
    const Paths before = support::allPaths(one.tree);
    for (const Paths& names :
         {Paths{"new"}, Paths{"new", "x", "y"}, Paths{"d7", "f", "x", "y"},
          Paths{"d7", "f"}, Paths{}}) {
        {
            Insertion insertion(*one.tree.root, one.pool, one.index, one.track);
            one.enter(insertion, names);
        }
        EXPECT_EQ(support::allPaths(one.tree), before);
        EXPECT_EQ(one.track, PathTrack{77});
        EXPECT_EQ(one.index.memoryBytes(), 0U);
    }
}

// The index knew the nodes that were taken back, by their addresses.
TEST(Insertion, FindsNothingOfWhatWasTakenBack) {
    Tree one;
    for (int round = 0; round < 3; ++round) {
        Insertion insertion(*one.tree.root, one.pool, one.index, one.track);
        one.enter(insertion, {"new"});
        EXPECT_FALSE(insertion.existed());
        EXPECT_EQ(one.track.back(), 12U);
        one.enter(insertion, {"x"});
        EXPECT_FALSE(insertion.existed());
    }
}

}  // namespace
