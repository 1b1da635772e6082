// Calls out of place: public state that was set by hand, lists that do not fit
// each other, handles to nothing and to other trees. Each is answered or
// refused.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <thread>

#include "coder/BatchEncoder.hpp"
#include "coder/PathNumbering.hpp"
#include "coder/PathRetrieval.hpp"
#include "pathtree/TrackLookup.hpp"
#include "pathtree/TreeInserter.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::component;
using support::components;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::CodeTable;
using tessel::Components;
using tessel::HNode;
using tessel::HuffmanPathTree;
using tessel::NodeStack;
using tessel::PathTrack;

// ---- Path numbers ----

// Three folders with a file each.
support::CoderPtr threePartitions() {
    support::CoderPtr coder = support::fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"a"});
    addBatch(*coder, {u"b"}, {u"b"});
    addBatch(*coder, {u"c"}, {u"c"});
    return coder;
}

TEST(WrongCallers, EndsThatFallDoNotStopAFetch) {
    const support::CoderPtr coder = threePartitions();
    coder->partitionEnds = {3, 1, 2};
    for (const double number : {1.0, 2.0, 3.0, 4.0, 1e18}) {
        std::vector<Components> folders;
        std::vector<Components> files;
        try {
            coder->getPath(folders, files, {number, number});
        } catch (const std::out_of_range&) {
        }
        EXPECT_LE(folders.size(), 2U) << number;
    }
}

TEST(WrongCallers, AFoundPartitionHoldsTheNumberWhateverTheEnds) {
    tessel::PathNumbering numbering;
    std::vector<std::uint64_t> ends{5, 1, 9, 2, 2, 7, 0, 3};
    numbering.partitionEnds.assign(ends.begin(), ends.end());
    for (std::size_t k = 0; k < 10; ++k) {
        for (std::uint64_t number = 0; number < 11; ++number) {
            const std::size_t at = numbering.partitionAtOrAfter(k, number);
            ASSERT_LE(at, ends.size());
            ASSERT_TRUE(at == ends.size() || ends[at] >= number);
        }
    }
}

TEST(WrongCallers, ASearchBeyondTheLastPartitionFindsNone) {
    const support::CoderPtr coder = threePartitions();
    const tessel::PathNumbering& numbering = coder->numbering();
    EXPECT_EQ(numbering.partitionAtOrAfter(4, 1), 3U);
    EXPECT_EQ(numbering.partitionAtOrAfter(~std::size_t{0}, 1), 3U);
}

TEST(WrongCallers, OneFileOfEachLargeBatchKeepsNoRoomForTheOthers) {
    const support::CoderPtr coder = support::fourLetterCoder();
    const support::Texts files(100, u"a");
    addBatch(*coder, {u"a"}, files);
    addBatch(*coder, {u"b"}, files);
    std::vector<double> numbers{1, 101};
    numbers.resize(50, 201);
    std::vector<Components> folders;
    std::vector<Components> found;
    coder->getPath(folders, found, numbers);
    ASSERT_EQ(found.size(), 2U);
    for (const Components& names : found) EXPECT_LE(names.capacity(), 2U);
}

// ---- The code ----

HNode linked(std::int32_t left, std::int32_t right) {
    HNode node;
    node.left = left;
    node.right = right;
    return node;
}

std::size_t visits(HuffmanPathTree& coder) {
    std::size_t count = 0;
    coder.traverse([&](HuffmanPathTree*, HNode&) { ++count; });
    return count;
}

TEST(WrongCallers, NodesThatAreNoTreeAreNotVisited) {
    const std::vector<std::vector<HNode>> wrong{
        {linked(0, 0)},                                // leads to itself
        {linked(1, 1), linked(2, 2), linked(-1, -1)},  // two ways to one node
        {linked(1, -1)},                               // leads outside
        {linked(-2, -1)},
        {linked(1, -1), linked(0, -1)},
    };
    for (const std::vector<HNode>& nodes : wrong) {
        HuffmanPathTree coder;
        coder.nodes = nodes;
        std::size_t count = 0;
        EXPECT_THROW(coder.traverse([&](HuffmanPathTree*, HNode&) { ++count; }),
                     std::logic_error);
        EXPECT_EQ(count, 0U);
        EXPECT_THROW(coder.generateCode(), std::logic_error);
        EXPECT_THROW(coder.generateCompressedTree(), std::logic_error);
        EXPECT_TRUE(coder.boolTree.empty());
    }
}

TEST(WrongCallers, AVisitorMayClearTheTreeThatItIsShown) {
    const support::CoderPtr coder = support::fourLetterCoder();
    std::size_t count = 0;
    coder->traverse([&](HuffmanPathTree* seen, HNode&) {
        seen->nodes.clear();
        ++count;
    });
    EXPECT_EQ(count, 7U);
    EXPECT_EQ(visits(*coder), 0U);
}

TEST(WrongCallers, ALongCodeWhoseTreeIsGoneOrTurnsInACircleIsRefused) {
    const support::CoderPtr coder = support::fourLetterCoder();
    coder->codes.insert(u'x', {0, 0, 0, true});
    coder->parentOf.assign(coder->nodes.size(), 0);
    EXPECT_THROW(coder->codeOf(u'x'), std::logic_error);
    coder->parentOf.assign(coder->nodes.size(), 1000);
    EXPECT_TRUE(coder->codeOf(u'x').empty());
    coder->parentOf.clear();
    EXPECT_TRUE(coder->codeOf(u'x').empty());
}

TEST(WrongCallers, AnEntryThatNoWriterCanWriteIsRefused) {
    CodeTable table;
    EXPECT_THROW(table.insert(u'a', {0, 0, 57, false}), std::invalid_argument);
    EXPECT_THROW(table.insert(u'a', {0, 0, 255, false}), std::invalid_argument);
    EXPECT_THROW(table.insert(u'a', {4, 0, 2, false}), std::invalid_argument);
    EXPECT_EQ(table.size(), 0U);
    table.insert(u'a', {3, 0, 2, false});
    EXPECT_EQ(table.size(), 1U);
}

TEST(WrongCallers, CharactersWithoutFrequenciesAreRefused) {
    HuffmanPathTree coder;
    coder.setTreeString(u"kept");
    EXPECT_THROW(coder.deflateHuffman(nullptr, u"ab"), std::invalid_argument);
    EXPECT_THROW(coder.makeHeapAndTree(nullptr, u"ab"), std::invalid_argument);
    EXPECT_EQ(coder.getTreeString(), u"kept");
    coder.deflateHuffman(nullptr, u"");
    EXPECT_TRUE(coder.nodes.empty());
}

// ---- Batches ----

TEST(WrongCallers, ARangeWithoutRoomForItsResultsIsRefused) {
    const support::CoderPtr coder = support::fourLetterCoder();
    coder->asyncFolders = {{u"a"}, {u"b"}};
    EXPECT_NO_THROW(coder->generateCodeForPath(2, 1)) << "there is no folder";
    EXPECT_THROW(coder->generateCodeForPath(0, 1), std::logic_error);
    coder->asyncFiles = {{u"c"}, {u"d"}};
    EXPECT_THROW(coder->generateCodeForPath(0, 1), std::logic_error);
    coder->encodedFolders.resize(2);
    EXPECT_THROW(coder->generateCodeForPath(0, 1), std::logic_error);
    coder->encodedFiles.resize(1);
    EXPECT_THROW(coder->generateCodeForPath(0, 1), std::logic_error);
    EXPECT_EQ(coder->maxCodeBytes, 0U);
    coder->generateCodeForPath(0, 0);
    EXPECT_THROW(coder->addPathToBTreeFromAsyncData(), std::logic_error);
    EXPECT_EQ(coder->pathCount, 0U);
    coder->encodedFiles.resize(2);
    coder->generateCodeForPath(1, ~std::uint64_t{0});
    coder->addPathToBTreeFromAsyncData();
    EXPECT_EQ(coder->pathCount, 2U);
}

TEST(WrongCallers, NoMoreThreadsAreStartedThanTheLimit) {
    const support::CoderPtr coder = support::fourLetterCoder();
    HuffmanPathTree::FolderTexts folders(3000, {u"a"});
    HuffmanPathTree::FolderTexts files(3000, {u"b"});
    coder->generateCodeAsyncAndAddPaths(folders, files, ~0U);
    EXPECT_EQ(coder->pathCount, 3000U);
}

TEST(WrongCallers, ACoderWithoutAPathTreeRefusesWhatNeedsIt) {
    const support::CoderPtr coder = threePartitions();
    HuffmanPathTree other;
    support::Bytes form;
    support::Bytes codes;
    Components path = components({"a"});
    coder->pathTree.reset();
    EXPECT_THROW(coder->addPathToBTree(path), std::logic_error);
    EXPECT_THROW(coder->addPathToBTree(path, path), std::logic_error);
    EXPECT_THROW(coder->getNextPathFromBTree(path), std::logic_error);
    EXPECT_THROW(static_cast<void>(coder->hasNextPathFromBTree()),
                 std::logic_error);
    EXPECT_THROW(coder->resetPathsToBTree(), std::logic_error);
    EXPECT_THROW(support::found(*coder, {1.0}), std::logic_error);
    EXPECT_THROW(coder->serialize(form, false), std::logic_error);
    EXPECT_THROW(coder->serializePathTree(codes, path), std::logic_error);
    EXPECT_THROW(coder->memoryUsage(), std::logic_error);
    EXPECT_THROW(other.copyTree(*coder), std::logic_error);
    EXPECT_TRUE(form.empty());
    coder->copyTree(other);
    EXPECT_FALSE(coder->hasNextPathFromBTree());
}

// ---- Path trees ----

TEST(WrongCallers, ARootThatIsAFileOrNothingIsATreeWithoutPaths) {
    BPathTree other;
    Components path = components({"file"});
    PathTrack track;
    other.addPath(path, track);
    for (const BNodePtr& root :
         {BNodePtr(), BNodePtr(other.root->children()[0])}) {
        BPathTree tree;
        tree.root = root;
        Components out;
        EXPECT_THROW(tree.traversePath({0}, out),
                     tessel::NoTreeToTraverseException);
        std::vector<Components> lists;
        EXPECT_THROW(tree.getPath(lists, lists, {0}, {{}}, {{1}}),
                     std::out_of_range);
        EXPECT_THROW(tree.getPath(lists, lists, {0}, {{0}}, {{1}}),
                     std::out_of_range);
        tree.reset();
        EXPECT_FALSE(tree.hasNextPath());
        EXPECT_EQ(tree.memoryUsage().names, 0U);
        support::Bytes codes;
        EXPECT_EQ(tree.serialize(codes, out), 0U);
        EXPECT_TRUE(codes.empty());
    }
}

TEST(WrongCallers, NothingIsInsertedUnderNoNode) {
    BPathTree tree;
    tree.root = BNodePtr();
    Components path = components({"a"});
    Components files = components({"b"});
    PathTrack track;
    std::uint64_t first = 0;
    EXPECT_THROW(tree.addPath(path, track), std::logic_error);
    EXPECT_THROW(tree.addPath(path, files, track, first), std::logic_error);
    EXPECT_EQ(path, components({"a"}));
    EXPECT_EQ(files, components({"b"}));
    EXPECT_TRUE(track.empty());
}

TEST(WrongCallers, AnEmptyStackHasNoTop) {
    NodeStack stack;
    stack.pop();
    EXPECT_TRUE(stack.empty());
    EXPECT_TRUE(stack.top().isLeaf());
    EXPECT_TRUE(stack.top().value().empty());
    EXPECT_EQ(stack.topChild().folder, nullptr);
    const BPathTree tree;
    EXPECT_FALSE(stack.isTopLastFileOf(*tree.root->folder()));
    stack.push(BNodePtr());
    EXPECT_TRUE(stack.top().value().empty());
}

TEST(WrongCallers, AVisitorMayTakeTheNextPathOrStartAnew) {
    BPathTree tree;
    Components folder = components({"folder"});
    Components files = components({"a", "b"});
    PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, files, track, first);
    tree.reset();
    tree.visitNextPath([&](const tessel::PathView&) {
        Components path;
        tree.getNextPath(path);
        EXPECT_EQ(path, components({"folder", "a"}));
    });
    EXPECT_FALSE(tree.hasNextPath());
    tree.reset();
    tree.visitNextPath([&](const tessel::PathView&) {
        while (tree.hasNextPath()) {
            Components path;
            tree.getNextPath(path);
        }
    });
    EXPECT_FALSE(tree.hasNextPath());
}

// There are enough children for an index, and enough folders that the new root
// takes the old root's memory. The index must not answer for a new folder at an
// old folder's address.
TEST(WrongCallers, ARootThatWasReplacedIsSearchedAnew) {
    for (int round = 0; round < 20; ++round) {
        BPathTree tree;
        PathTrack track;
        for (std::size_t i = 0; i < 200; ++i) {
            Components path = components({support::numbered("old", i), "x"});
            tree.addPath(path, track);
        }
        tree.root = BNodePtr();
        BPathTree other;
        for (std::size_t i = 0; i < 12; ++i) {
            Components path = components({support::numbered("new", i), "x"});
            other.addPath(path, track);
        }
        tree.root = other.root;
        for (std::size_t i = 0; i < 12; ++i) {
            Components path = components({support::numbered("new", i), "x"});
            track.clear();
            EXPECT_TRUE(tree.addPath(path, track));
            EXPECT_EQ(track, (PathTrack{i, 0}));
        }
    }
}

}  // namespace
