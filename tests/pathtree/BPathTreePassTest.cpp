// The pass over a path tree.

#include <gtest/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::allPaths;
using support::components;
using support::textsOf;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::Components;
using tessel::NodeStack;
using Paths = std::vector<std::string>;

std::vector<std::string> next(BPathTree& tree) {
    Components path;
    tree.getNextPath(path);
    return textsOf(path);
}

// The next path with the number of its folders that did not change.
std::string nextView(BPathTree& tree) {
    std::string seen;
    tree.visitNextPath([&seen](const tessel::PathView& path) {
        seen = std::to_string(path.unchangedFolders);
        for (const auto& folder : path.folders)
            seen.append(" ").append(support::textOf(folder));
        seen.append(" ").append(support::textOf(path.name));
    });
    return seen;
}

TEST(PathTreeIteration, AVisitShowsThePathAndWhatDidNotChange) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    addBatch(tree, {"a"}, {"h"});
    addBatch(tree, {"c", "b"}, {"i"});
    tree.reset();
    EXPECT_EQ(nextView(tree), "0 a b f");
    EXPECT_EQ(nextView(tree), "2 a b g");
    EXPECT_EQ(nextView(tree), "1 a h");
    EXPECT_EQ(nextView(tree), "0 c b i");
    EXPECT_THROW(nextView(tree), tessel::NoMorePathException);
    tree.reset();
    EXPECT_EQ(nextView(tree), "0 a b f");
    tree.reset();
    EXPECT_EQ(nextView(tree), "0 a b f");
    BPathTree copy(tree);
    EXPECT_EQ(nextView(copy), "0 a b g");
    EXPECT_EQ(next(tree), (Paths{"a", "b", "g"}));
    EXPECT_EQ(nextView(tree), "1 a h");
}

TEST(PathTreeIteration, AVisitThatThrowsMayBeRepeated) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    tree.reset();
    EXPECT_THROW(tree.visitNextPath([](const tessel::PathView&) { throw 1; }),
                 int);
    EXPECT_EQ(nextView(tree), "0 a b f");
    EXPECT_THROW(tree.visitNextPath([](const tessel::PathView&) { throw 1; }),
                 int);
    EXPECT_EQ(nextView(tree), "2 a b g");
    EXPECT_FALSE(tree.hasNextPath());
}

TEST(PathTreeIteration, ASinglePathOfOneComponent) {
    BPathTree tree;
    addWhole(tree, {"x"});
    tree.reset();
    EXPECT_TRUE(tree.hasNextPath());
    EXPECT_EQ(next(tree), Paths{"x"});
    EXPECT_FALSE(tree.hasNextPath());
    EXPECT_THROW(next(tree), tessel::NoMorePathException);
}

TEST(PathTreeIteration, AFolderWithoutFilesIsReturnedAsAPath) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {});
    addBatch(tree, {"c"}, {"d"});
    EXPECT_EQ(allPaths(tree), (Paths{"a/b", "c/d"}));
}

TEST(PathTreeIteration, APathThatWasExtendedIsNotReturned) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    addWhole(tree, {"a", "b", "c"});
    EXPECT_EQ(allPaths(tree), Paths{"a/b/c"});
}

TEST(PathTreeIteration, EqualFileNamesAreReturnedInTheirOrder) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g", "f"});
    EXPECT_EQ(allPaths(tree), (Paths{"a/f", "a/g", "a/f"}));
}

TEST(PathTreeIteration, ADuplicateWholePathIsReturnedOnce) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    addWhole(tree, {"a", "b"});
    EXPECT_EQ(allPaths(tree), Paths{"a/b"});
}

TEST(PathTreeIteration, ResetAmidAPassStartsAgain) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    addBatch(tree, {"c"}, {"h"});
    tree.reset();
    next(tree);
    next(tree);
    EXPECT_EQ(allPaths(tree), (Paths{"a/b/f", "a/b/g", "c/h"}));
}

// The nodes of a pass that was under way stay where they are.
TEST(PathTreeIteration, ResetOnATreeThatBecameEmptyChangesNothing) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"x", "y"});
    tree.reset();
    tessel::Components path;
    tree.getNextPath(path);
    std::vector<std::uint8_t> structure;
    tessel::Components values;
    tree.deserialize(structure, values);
    tree.reset();
    EXPECT_EQ(tree.pendingNodes.size(), 1U);
    EXPECT_EQ(tree.parentNodes.size(), 2U);
    EXPECT_EQ(tree.currentPrefix.size(), 1U);
    EXPECT_FALSE(tree.hasNextPath());
}

TEST(PathTreeIteration, ResetOnAnEmptyTreeLeavesNoPath) {
    BPathTree tree;
    tree.reset();
    EXPECT_FALSE(tree.hasNextPath());
    EXPECT_TRUE(tree.pendingNodes.empty());
    EXPECT_TRUE(tree.parentNodes.empty());
    EXPECT_THROW(next(tree), tessel::NoMorePathException);
}

TEST(PathTreeIteration, OnlyTheReturnedPathIsInTheOutput) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    tree.reset();
    Components path = components({"1", "2", "3", "4"});
    tree.getNextPath(path);
    EXPECT_EQ(textsOf(path), (Paths{"a", "b"}));
}

TEST(PathTreeIteration, PathsOfOneFolderComeTogetherInInsertionOrder) {
    BPathTree tree;
    addWhole(tree, {"a", "x"});
    addWhole(tree, {"b", "y"});
    addWhole(tree, {"a", "z"});
    EXPECT_EQ(allPaths(tree), (Paths{"a/x", "a/z", "b/y"}));
}

TEST(PathTreeIteration, FilesBetweenFoldersAndAfterThem) {
    BPathTree tree;
    addBatch(tree, {"a", "b", "c"}, {"1"});
    addBatch(tree, {"a", "b"}, {"2"});
    addBatch(tree, {"a"}, {"3"});
    addBatch(tree, {"a", "d"}, {"4"});
    addBatch(tree, {}, {"5"});
    addBatch(tree, {"e", "f"}, {"6"});
    EXPECT_EQ(allPaths(tree),
              (Paths{"a/b/c/1", "a/b/2", "a/3", "a/d/4", "5", "e/f/6"}));
}

TEST(PathTreeIteration, BeforeTheFirstResetThereIsNoPath) {
    BPathTree tree;
    addWhole(tree, {"a"});
    EXPECT_FALSE(tree.hasNextPath());
    EXPECT_THROW(next(tree), tessel::NoMorePathException);
}

TEST(PathTreeIteration, PastTheEndNothingChanges) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    allPaths(tree);
    Components path = components({"1"});
    EXPECT_THROW(tree.getNextPath(path), tessel::NoMorePathException);
    EXPECT_EQ(textsOf(path), Paths{"1"});
    EXPECT_TRUE(tree.pendingNodes.empty());
    EXPECT_TRUE(tree.currentPrefix.empty());
}

TEST(PathTreeIteration, InsertionDoesNotStartAPass) {
    BPathTree tree;
    addWhole(tree, {"a"});
    allPaths(tree);
    addWhole(tree, {"b"});
    EXPECT_FALSE(tree.hasNextPath());
    EXPECT_EQ(allPaths(tree), (Paths{"a", "b"}));
}

TEST(PathTreeIteration, BetweenCallsTheStacksAndThePrefixAgree) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    addBatch(tree, {"a"}, {"h"});
    tree.reset();
    EXPECT_EQ(tree.parentNodes.size(), 1U);
    EXPECT_TRUE(tree.parentNodes.top() == *tree.root);
    EXPECT_TRUE(tree.currentPrefix.empty());

    EXPECT_EQ(next(tree), (Paths{"a", "b", "f"}));
    EXPECT_EQ(textsOf(tree.currentPrefix), (Paths{"a", "b"}));
    EXPECT_EQ(tree.parentNodes.size(), 3U);
    EXPECT_EQ(support::textOf(tree.parentNodes.top().value()), "b");
    EXPECT_EQ(support::textOf(tree.pendingNodes.top().value()), "g");

    EXPECT_EQ(next(tree), (Paths{"a", "b", "g"}));
    EXPECT_EQ(textsOf(tree.currentPrefix), Paths{"a"});
    EXPECT_EQ(support::textOf(tree.parentNodes.top().value()), "a");
    EXPECT_EQ(support::textOf(tree.pendingNodes.top().value()), "h");

    EXPECT_EQ(next(tree), (Paths{"a", "h"}));
    EXPECT_TRUE(tree.currentPrefix.empty());
    EXPECT_TRUE(tree.parentNodes.empty());
    EXPECT_TRUE(tree.pendingNodes.empty());
}

TEST(PathTreeIteration, ACopyContinuesFromTheSamePointOnItsOwn) {
    BPathTree source;
    addBatch(source, {"a"}, {"f", "g", "h"});
    addBatch(source, {"b"}, {"i"});
    source.reset();
    next(source);
    BPathTree copy(source);
    EXPECT_EQ(next(copy), (Paths{"a", "g"}));
    EXPECT_EQ(next(copy), (Paths{"a", "h"}));
    EXPECT_EQ(next(source), (Paths{"a", "g"}));
    EXPECT_EQ(next(copy), (Paths{"b", "i"}));
    EXPECT_FALSE(copy.hasNextPath());
    EXPECT_TRUE(source.hasNextPath());
    EXPECT_EQ(next(source), (Paths{"a", "h"}));
}

TEST(PathTreeIteration, ACopysPassOutlivesTheSource) {
    auto source = std::make_unique<BPathTree>();
    addBatch(*source, {"a", "b"}, {"f", "g"});
    source->reset();
    next(*source);
    BPathTree copy(*source);
    source.reset();
    EXPECT_EQ(next(copy), (Paths{"a", "b", "g"}));
    EXPECT_FALSE(copy.hasNextPath());
}

// ---- The stacks' helpers ----

TEST(PathTreeIteration, PushAllChildrenPutsTheFirstOnTop) {
    BPathTree tree;
    addBatch(tree, {}, {"1", "2", "3"});
    NodeStack stack;
    tree.pushAllChildren(tree.root, stack);
    EXPECT_EQ(stack.size(), 3U);
    for (const std::string expected : {"1", "2", "3"}) {
        EXPECT_EQ(support::textOf(stack.top().value()), expected);
        stack.pop();
    }
    EXPECT_TRUE(stack.empty());
    EXPECT_TRUE(tree.pendingNodes.empty());
    tree.pushAllChildren(tree.root);
    EXPECT_EQ(tree.pendingNodes.size(), 3U);
}

TEST(PathTreeIteration, PushAllChildrenOfALeafPushesNothing) {
    BPathTree tree;
    NodeStack stack;
    tree.pushAllChildren(tree.root, stack);
    EXPECT_TRUE(stack.empty());
}

TEST(PathTreeIteration, TheEndOfAParentIsAMatterOfIdentity) {
    BPathTree tree;
    addBatch(tree, {}, {"same", "same"});
    const BNodePtr first(tree.root->children()[0]);
    const BNodePtr last(tree.root->children()[1]);
    NodeStack stack;
    EXPECT_FALSE(tree.isNodeAtEndOfParent(last, stack));
    stack.push(tree.root);
    EXPECT_TRUE(tree.isNodeAtEndOfParent(last, stack));
    EXPECT_FALSE(tree.isNodeAtEndOfParent(first, stack));
    stack.push(first);  // which has no children
    EXPECT_FALSE(tree.isNodeAtEndOfParent(last, stack));

    EXPECT_FALSE(tree.isNodeAtEndOfParent(last));
    tree.reset();
    EXPECT_TRUE(tree.isNodeAtEndOfParent(last));
    EXPECT_FALSE(tree.isNodeAtEndOfParent(first));
}

}  // namespace
