// The path tree: its nodes, whole paths, batches of files, copies, release.

#include <gtest/gtest.h>

#include <type_traits>

#include "pathtree/BPathTree.hpp"
#include "tests/support/Exceptions.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::allPaths;
using support::BatchAdded;
using support::childTexts;
using support::component;
using support::components;
using support::WholeAdded;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::Component;
using tessel::Components;
using tessel::PathTrack;
using Paths = std::vector<std::string>;

constexpr std::uint64_t allOnes = 0xFFFFFFFFFFFFFFFF;

// ---- A fresh tree ----

TEST(PathTreeInsertion, AFreshTreeIsARootWithoutAValue) {
    BPathTree tree;
    ASSERT_TRUE(tree.root);
    EXPECT_TRUE(tree.root->value().empty());
    EXPECT_TRUE(tree.root->isLeaf());
    EXPECT_TRUE(tree.isLeaf(tree.root));
    EXPECT_TRUE(tree.pendingNodes.empty());
    EXPECT_TRUE(tree.parentNodes.empty());
    EXPECT_TRUE(tree.currentPrefix.empty());
    EXPECT_FALSE(tree.spareFlag);
    EXPECT_EQ(BPathTree::allOnes, allOnes);
}

TEST(PathTreeInsertion, TheExceptionsSayTheirTexts) {
    EXPECT_STREQ(tessel::NoMorePathException().what(),
                 "No more paths to provide.");
    EXPECT_STREQ(tessel::NoTreeToTraverseException().what(),
                 "Cannot traverse an empty tree for a path.");
    EXPECT_STREQ(tessel::EmptyPathForTraverseException().what(),
                 "Cannot traverse an tree for an empty path track.");
    EXPECT_STREQ(tessel::UnknownNodeTypeException().what(),
                 "Cannot determine the node type for the given value.");
}

TEST(PathTreeInsertion, TheExceptionsDeriveFromTheStandardBaseAlone) {
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::NoMorePathException>());
    EXPECT_TRUE(support::derivesFromStandardBaseAlone<
                tessel::NoTreeToTraverseException>());
    EXPECT_TRUE(support::derivesFromStandardBaseAlone<
                tessel::EmptyPathForTraverseException>());
    EXPECT_TRUE(support::derivesFromStandardBaseAlone<
                tessel::UnknownNodeTypeException>());
}

// ---- Whole paths ----

TEST(PathTreeInsertion, AWholePathAddedTwiceIsFoundCompletely) {
    BPathTree tree;
    EXPECT_EQ(addWhole(tree, {"a", "b", "c"}), (WholeAdded{false, {}}));
    EXPECT_EQ(addWhole(tree, {"a", "b", "c"}), (WholeAdded{true, {0, 0, 0}}));
    EXPECT_EQ(allPaths(tree), Paths{"a/b/c"});
}

TEST(PathTreeInsertion, AProperPrefixOfAStoredPathExists) {
    BPathTree tree;
    addWhole(tree, {"a", "b", "c"});
    EXPECT_EQ(addWhole(tree, {"a", "b"}), (WholeAdded{true, {0, 0}}));
    EXPECT_EQ(allPaths(tree), Paths{"a/b/c"});
}

TEST(PathTreeInsertion, AnExtensionOfAStoredPathReplacesIt) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    EXPECT_EQ(addWhole(tree, {"a", "b", "c"}), (WholeAdded{false, {0, 0}}));
    EXPECT_EQ(allPaths(tree), Paths{"a/b/c"});
}

TEST(PathTreeInsertion, AWholePathOfNoComponentsChangesNothing) {
    BPathTree tree;
    addWhole(tree, {"a"});
    PathTrack track = {7};
    Components none;
    EXPECT_FALSE(tree.addPath(none, track));
    EXPECT_EQ(track, PathTrack{7});
    EXPECT_EQ(allPaths(tree), Paths{"a"});
}

TEST(PathTreeInsertion, TheTrackIsThePartThatWasStored) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    addWhole(tree, {"x", "y"});
    EXPECT_EQ(addWhole(tree, {"x", "z", "b"}), (WholeAdded{false, {1}}));
    EXPECT_EQ(addWhole(tree, {"x", "z", "b"}), (WholeAdded{true, {1, 1, 0}}));
}

TEST(PathTreeInsertion, TracksAreAppended) {
    BPathTree tree;
    addWhole(tree, {"a"});
    PathTrack track = {9};
    Components path = components({"a"});
    EXPECT_TRUE(tree.addPath(path, track));
    EXPECT_EQ(track, (PathTrack{9, 0}));
}

TEST(PathTreeInsertion, NewComponentsAreMovedAndFoundOnesStay) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    Components path = components({"a", "c", "d"});
    PathTrack track;
    tree.addPath(path, track);
    EXPECT_EQ(path, (Components{component("a"), {}, {}}));
}

// ---- Batches of files ----

TEST(PathTreeInsertion, ANewFolderReportsItsTrackAndNoPosition) {
    BPathTree tree;
    addWhole(tree, {"x"});
    EXPECT_EQ(addBatch(tree, {"a", "b"}, {"f", "g"}),
              (BatchAdded{false, {1, 0}, allOnes}));
    EXPECT_EQ(allPaths(tree), (Paths{"x", "a/b/f", "a/b/g"}));
}

TEST(PathTreeInsertion, AStoredFolderReportsWhereTheBatchStarts) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g", "h"});
    EXPECT_EQ(addBatch(tree, {"a"}, {"i", "j"}), (BatchAdded{true, {0}, 3}));
    EXPECT_EQ(childTexts(tree.root->children()[0]),
              (Paths{"f", "g", "h", "i", "j"}));
}

TEST(PathTreeInsertion, AStoredFoldersPositionsAreAppendedToTheTrack) {
    BPathTree tree;
    addBatch(tree, {"x"}, {"y"});
    addBatch(tree, {"a"}, {"f", "g", "h"});
    Components folder = components({"a"});
    Components files = components({"i"});
    PathTrack track = {9};
    std::uint64_t firstFile = 0;
    EXPECT_TRUE(tree.addPath(folder, files, track, firstFile));
    EXPECT_EQ(track, (PathTrack{9, 1}));
    EXPECT_EQ(firstFile, 3U);
    EXPECT_EQ(childTexts(tree.root->children()[1]),
              (Paths{"f", "g", "h", "i"}));
}

TEST(PathTreeInsertion, ANewFolderInAStoredOneIsNew) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    EXPECT_EQ(addBatch(tree, {"a", "b"}, {"g"}),
              (BatchAdded{false, {0, 1}, allOnes}));
}

TEST(PathTreeInsertion, WithoutAFolderTheFilesGoUnderTheRoot) {
    BPathTree tree;
    EXPECT_EQ(addBatch(tree, {}, {"f", "g"}), (BatchAdded{false, {}, allOnes}));
    EXPECT_EQ(addBatch(tree, {}, {"h"}), (BatchAdded{false, {}, allOnes}));
    EXPECT_EQ(childTexts(*tree.root), (Paths{"f", "g", "h"}));
}

TEST(PathTreeInsertion, AnEqualNameInOneBatchIsASecondLeaf) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "f"});
    EXPECT_EQ(childTexts(tree.root->children()[0]), (Paths{"f", "f"}));
}

TEST(PathTreeInsertion, AnEqualNameInALaterBatchIsASecondLeaf) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    addBatch(tree, {"a"}, {"f"});
    addBatch(tree, {"a", "b"}, {"g"});
    addBatch(tree, {"a"}, {"b"});
    EXPECT_EQ(childTexts(tree.root->children()[0]),
              (Paths{"f", "f", "b", "b"}));
    EXPECT_EQ(allPaths(tree), (Paths{"a/f", "a/f", "a/b/g", "a/b"}));
}

TEST(PathTreeInsertion, AFolderWithoutFilesIsALeaf) {
    BPathTree tree;
    EXPECT_EQ(addBatch(tree, {"a", "b"}, {}),
              (BatchAdded{false, {0, 0}, allOnes}));
    EXPECT_EQ(allPaths(tree), Paths{"a/b"});
    EXPECT_EQ(addBatch(tree, {"a", "b"}, {}), (BatchAdded{true, {0, 0}, 0}));
}

TEST(PathTreeInsertion, AFileWhoseNameIsAFolderComponentBecomesTheFolder) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"b", "c", "b"});
    EXPECT_EQ(addBatch(tree, {"a", "b"}, {"f"}), (BatchAdded{true, {0, 0}, 0}));
    EXPECT_EQ(allPaths(tree), (Paths{"a/b/f", "a/c", "a/b"}));
}

TEST(PathTreeInsertion, OfEqualChildrenTheFirstIsFound) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"x", "b", "b"});
    EXPECT_EQ(addWhole(tree, {"a", "b"}), (WholeAdded{true, {0, 1}}));
}

TEST(PathTreeInsertion, NewFolderComponentsAndFilesAreMoved) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f"});
    Components folder = components({"a", "b"});
    Components files = components({"g", "h"});
    PathTrack track = {5};
    std::uint64_t firstFile = 1;
    EXPECT_FALSE(tree.addPath(folder, files, track, firstFile));
    EXPECT_EQ(folder, (Components{component("a"), {}}));
    EXPECT_EQ(files, (Components{{}, {}}));
    EXPECT_EQ(track, (PathTrack{5, 0, 1}));
    EXPECT_EQ(firstFile, allOnes);
}

// ---- Components ----

TEST(PathTreeInsertion, AnEmptyComponentEqualsOnlyAnEmptyOne) {
    BPathTree tree;
    EXPECT_EQ(addWhole(tree, {"", "a"}), (WholeAdded{false, {}}));
    EXPECT_EQ(addWhole(tree, {"a", ""}), (WholeAdded{false, {}}));
    EXPECT_EQ(addWhole(tree, {""}), (WholeAdded{true, {0}}));
    EXPECT_EQ(addWhole(tree, {"", "a"}), (WholeAdded{true, {0, 0}}));
}

TEST(PathTreeInsertion, ComponentsDifferByLengthAndByAnyByte) {
    BPathTree tree;
    const Paths names = {
        "aa", "a", "aaa", std::string(1, '\0'), std::string(2, '\0'),
        "ab", "ba"};
    for (const std::string& name : names)
        EXPECT_EQ(addWhole(tree, {name}), (WholeAdded{false, {}}));
    for (std::size_t i = 0; i < names.size(); ++i)
        EXPECT_EQ(addWhole(tree, {names[i]}), (WholeAdded{true, {i}}));
}

TEST(PathTreeInsertion, ComponentsOfEveryLengthAreKept) {
    BPathTree tree;
    Components files;
    for (std::size_t length = 0; length < 300; ++length)
        files.push_back(Component(length, static_cast<std::uint8_t>(length)));
    for (const std::size_t length : {16000U, 70000U, 1000000U})
        files.push_back(Component(length, 0x5A));
    const Components expected = files;
    Components folder = {Component(5000, 1)};
    PathTrack track;
    std::uint64_t firstFile = 0;
    tree.addPath(folder, files, track, firstFile);
    const tessel::BNode& made = tree.root->children()[0];
    EXPECT_EQ(made.value().size(), 5000U);
    ASSERT_EQ(made.children().size(), expected.size());
    for (std::size_t i = 0; i < expected.size(); ++i)
        EXPECT_TRUE(
            tessel::sameComponent(made.children()[i].value(), expected[i]));
}

TEST(PathTreeInsertion, NodesOfEveryLengthCanGetChildren) {
    BPathTree tree;
    for (std::size_t length = 0; length < 200; ++length) {
        const std::string name(length, 'n');
        addBatch(tree, {}, {name});
        addWhole(tree, {name, "child"});
        addWhole(tree, {name, "child", name});
    }
    for (std::size_t i = 0; i < 200; ++i) {
        const tessel::BNode& node = tree.root->children()[i];
        EXPECT_EQ(node.value().size(), i);
        ASSERT_EQ(childTexts(node), Paths{"child"});
        EXPECT_EQ(node.children()[0].children()[0].value().size(), i);
    }
}

// ---- Searching among children ----

// One child stands in its parent's node, several in an array: all must be
// found, kept and in order on the way from none to many, whether the parent
// was made as a folder or as a file.
TEST(PathTreeInsertion, ChildrenStayInOrderAsTheirListGrows) {
    for (const bool madeAsFile : {false, true}) {
        for (const std::size_t step : {1U, 2U, 3U}) {
            BPathTree tree;
            if (madeAsFile) addWhole(tree, {"f"});
            Paths expected;
            for (std::size_t round = 0; round < 9; ++round) {
                Paths names;
                for (std::size_t i = 0; i < step; ++i)
                    names.push_back(support::numbered("", round * step + i));
                addBatch(tree, {"f"}, names);
                expected.insert(expected.end(), names.begin(), names.end());
                EXPECT_EQ(childTexts(tree.root->children()[0]), expected);
            }
        }
    }
}

TEST(PathTreeInsertion, FindNodeOnAnEmptyListFindsNothing) {
    const BPathTree tree;
    EXPECT_EQ(tree.findNode(component("a"), tree.root->children()), allOnes);
    EXPECT_EQ(tree.findNode({}, tree.root->children()), allOnes);
}

TEST(PathTreeInsertion, FindNodeGivesTheFirstMatch) {
    BPathTree tree;
    addBatch(tree, {}, {"x", "a", "", "a", ""});
    EXPECT_EQ(tree.findNode(component("a"), tree.root->children()), 1U);
    EXPECT_EQ(tree.findNode({}, tree.root->children()), 2U);
    EXPECT_EQ(tree.findNode(component("b"), tree.root->children()), allOnes);
}

TEST(PathTreeInsertion, AddIfExistsAndFindTellsWhatItDid) {
    const BPathTree tree;
    bool existed = true;
    Component value = component("a");
    EXPECT_EQ(tree.addIfExistsAndFind(tree.root->children(), value, existed),
              0U);
    EXPECT_FALSE(existed);
    EXPECT_TRUE(value.empty());
    value = component("b");
    EXPECT_EQ(tree.addIfExistsAndFind(tree.root->children(), value, existed),
              1U);
    EXPECT_FALSE(existed);
    value = component("a");
    EXPECT_EQ(tree.addIfExistsAndFind(tree.root->children(), value, existed),
              0U);
    EXPECT_TRUE(existed);
    EXPECT_EQ(value, component("a"));
    EXPECT_EQ(childTexts(*tree.root), (Paths{"a", "b"}));
}

TEST(PathTreeInsertion, AddIfExistsAndFindWorksOnAnyTreesNodes) {
    const BPathTree tree;
    for (int round = 0; round < 50; ++round) {
        BPathTree other;
        const tessel::ChildList children = other.root->children();
        for (std::uint64_t i = 0; i < 20; ++i) {
            bool existed = true;
            Component value = component(support::numbered("n", i));
            EXPECT_EQ(tree.addIfExistsAndFind(children, value, existed), i);
            EXPECT_FALSE(existed);
            value = component("n0");
            EXPECT_EQ(tree.addIfExistsAndFind(children, value, existed), 0U);
            EXPECT_TRUE(existed);
        }
    }
    EXPECT_TRUE(tree.root->isLeaf());
}

// ---- Copies ----

TEST(PathTreeInsertion, APathAddedThroughACopyIsSeenByTheSource) {
    BPathTree source;
    addWhole(source, {"a", "b"});
    BPathTree copy(source);
    EXPECT_EQ(copy.root, source.root);
    addWhole(copy, {"a", "c"});
    addBatch(copy, {"d"}, {"e"});
    EXPECT_EQ(allPaths(source), (Paths{"a/b", "a/c", "d/e"}));
    EXPECT_EQ(addWhole(source, {"a", "c"}), (WholeAdded{true, {0, 1}}));
    addWhole(source, {"f"});
    EXPECT_EQ(allPaths(copy), (Paths{"a/b", "a/c", "d/e", "f"}));
}

TEST(PathTreeInsertion, ACopyTakesOverTheSpareFlag) {
    BPathTree source;
    source.spareFlag = true;
    EXPECT_TRUE(BPathTree(source).spareFlag);
}

TEST(PathTreeInsertion, ACopyOutlivesItsSource) {
    auto source = std::make_unique<BPathTree>();
    for (std::size_t i = 0; i < 2000; ++i)
        addBatch(*source, {support::numbered("folder", i % 50)},
                 {support::numbered("file", i)});
    const Paths before = allPaths(*source);
    BPathTree copy(*source);
    source.reset();
    EXPECT_EQ(allPaths(copy), before);
    addWhole(copy, {"folder7", "later"});
    EXPECT_EQ(allPaths(copy).size(), before.size() + 1);
}

TEST(PathTreeInsertion, ASourceOutlivesItsCopiesAndTheirInsertions) {
    BPathTree source;
    addBatch(source, {"a"}, {"b"});
    {
        BPathTree first(source);
        BPathTree second(first);
        addBatch(first, {"a"}, {"c"});
        addBatch(second, {"a", "b"}, {"d"});
    }
    EXPECT_EQ(allPaths(source), (Paths{"a/b/d", "a/c"}));
    addBatch(source, {"a", "b"}, {"e"});
    EXPECT_EQ(allPaths(source), (Paths{"a/b/d", "a/b/e", "a/c"}));
}

// ---- Memory ----

TEST(PathTreeInsertion, ResetReleasesWhatInsertionRemembered) {
    BPathTree tree;
    EXPECT_EQ(tree.memoryUsage().childIndex, 0U);
    for (std::size_t i = 0; i < 100; ++i)
        addWhole(tree, {support::numbered("d", i), "f"});
    EXPECT_GT(tree.memoryUsage().childIndex, 100U);
    tree.reset();
    EXPECT_EQ(tree.memoryUsage().childIndex, 0U);
    EXPECT_EQ(addWhole(tree, {"d57", "f"}), (WholeAdded{true, {57, 0}}));
}

TEST(PathTreeInsertion, ComponentsThatBecameNodesKeepNoMemory) {
    const std::string text(100, 'x');
    BPathTree tree;
    Components folder = components({text + "1", text + "2"});
    Components files = components({text + "f", text + "g"});
    PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, files, track, first);
    Components whole = components({text + "3", text + "4"});
    tree.addPath(whole, track);
    for (const Components* list : {&folder, &files, &whole})
        for (const tessel::Component& value : *list)
            EXPECT_EQ(value.capacity(), 0U);
}

TEST(PathTreeInsertion, ANodeIsALeafExactlyWithoutChildren) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    const BNodePtr folder(tree.root->children()[0]);
    const BNodePtr file(folder->children()[0]);
    EXPECT_FALSE(tree.isLeaf(tree.root));
    EXPECT_FALSE(tree.isLeaf(folder));
    EXPECT_TRUE(tree.isLeaf(file));
    addWhole(tree, {"a", "b", "c"});
    EXPECT_FALSE(tree.isLeaf(file));
}

TEST(PathTreeInsertion, AListOfChildrenKnowsWhetherThereIsAFolder) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    const tessel::FolderNode& folder = *tree.root->children()[0].folder();
    EXPECT_TRUE(tree.root->folder()->children().hasFolders());
    EXPECT_FALSE(folder.children().hasFolders());
    addBatch(tree, {"a", "f"}, {"x"});
    EXPECT_TRUE(folder.children().hasFolders());
}

// Only the root has a block of its own: it was there before its child.
TEST(PathTreeMemory, ChildrenWithinTheirFoldersNodeTakeNoList) {
    BPathTree tree;
    addBatch(tree, {"a", "b", "c", "d"}, {"f"});
    EXPECT_GT(tree.root->folder()->ownChildBytes(), 0U);
    EXPECT_EQ(tree.memoryUsage().childLists,
              tree.root->folder()->ownChildBytes());
}

}  // namespace
