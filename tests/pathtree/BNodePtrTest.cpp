// Handles that share nodes.

#include <gtest/gtest.h>

#include <utility>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/BPathTree.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::childTexts;
using tessel::BNodePtr;
using tessel::BPathTree;
using Paths = std::vector<std::string>;

TEST(BNodePtr, AHeldNodeKeepsWhatIsBelowItAlive) {
    BNodePtr held;
    {
        BPathTree tree;
        addBatch(tree, {"a", "b"}, {"f", "g"});
        held = BNodePtr(tree.root->children()[0].children()[0]);
    }
    EXPECT_EQ(support::textOf(held->value()), "b");
    EXPECT_EQ(childTexts(*held), (Paths{"f", "g"}));
}

TEST(BNodePtr, HandlesAreSharedMovedAndEmptied) {
    BPathTree tree;
    addWhole(tree, {"a"});
    BNodePtr first(tree.root->children()[0]);
    BNodePtr second = first;
    EXPECT_TRUE(first == second);
    const BNodePtr moved = std::move(second);
    EXPECT_FALSE(second);
    EXPECT_TRUE(moved == first);
    first = BNodePtr();
    EXPECT_FALSE(first);
    EXPECT_EQ(support::textOf((*moved).value()), "a");
    EXPECT_TRUE(BNodePtr() == BNodePtr());
    EXPECT_FALSE(BNodePtr() == moved);
    EXPECT_FALSE(moved == BNodePtr());
}

TEST(BNodePtr, AHeldFileKeepsItsFolderAlive) {
    BNodePtr held;
    {
        BPathTree tree;
        addBatch(tree, {"a"}, {"f", "g"});
        held = BNodePtr(tree.root->children()[0].children()[1]);
    }
    EXPECT_EQ(support::textOf(held->value()), "g");
    EXPECT_TRUE(held->isLeaf());
}

TEST(BNodePtr, AFileThatBecomesAFolderIsTheSameNode) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    const BNodePtr before(tree.root->children()[0].children()[1]);
    const BNodePtr other(tree.root->children()[0].children()[0]);
    addBatch(tree, {"a", "g"}, {"x"});
    const BNodePtr after(tree.root->children()[0].children()[1]);
    EXPECT_TRUE(before == after);
    EXPECT_FALSE(before == other);
    EXPECT_FALSE(after == other);
    EXPECT_EQ(childTexts(*before), Paths{"x"});
    EXPECT_EQ(support::textOf(before->value()), "g");
}

}  // namespace
