// The Huffman code: construction, its ties, the code table, copies.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <stdexcept>
#include <type_traits>

#include "tests/support/Coders.hpp"

namespace {

using support::bitText;
using support::CoderPtr;
using support::coderWith;
using support::codeText;
using tessel::HuffmanPathTree;
using Frequencies = std::vector<double>;

// ---- Worked examples ----

TEST(HuffmanCode, ThreeCharactersOfWhichOneIsFrequent) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(codeText(*coder, u'b'), "10");
    EXPECT_EQ(codeText(*coder, u'c'), "11");
    EXPECT_EQ(bitText(coder->getBoolTree()), "01011");
    EXPECT_EQ(coder->getTreeString(), u"abc");
}

TEST(HuffmanCode, FourEqualFrequenciesMergeTheFirstAndTheThird) {
    const CoderPtr coder = coderWith(u"abcd", {1, 1, 1, 1});
    EXPECT_EQ(codeText(*coder, u'a'), "00");
    EXPECT_EQ(codeText(*coder, u'c'), "01");
    EXPECT_EQ(codeText(*coder, u'b'), "10");
    EXPECT_EQ(codeText(*coder, u'd'), "11");
    EXPECT_EQ(bitText(coder->getBoolTree()), "0011011");
    EXPECT_EQ(coder->getTreeString(), u"acbd");
}

TEST(HuffmanCode, FiveCharactersOfMixedFrequencies) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(codeText(*coder, u'e'), "10");
    EXPECT_EQ(codeText(*coder, u'c'), "110");
    EXPECT_EQ(codeText(*coder, u'b'), "1110");
    EXPECT_EQ(codeText(*coder, u'd'), "1111");
    EXPECT_EQ(bitText(coder->getBoolTree()), "010101011");
    EXPECT_EQ(coder->getTreeString(), u"aecbd");
}

TEST(HuffmanCode, FrequenciesComeBackInTheOrderOfTheLeaves) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{5, 3, 2, 1, 1}));
}

// ---- Ties and special characters ----

TEST(HuffmanCode, OfTwoEquallyFrequentCharactersTheFirstGetsZero) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(codeText(*coder, u'b'), "1");
}

TEST(HuffmanCode, OfTwoCharactersTheRarerGetsZero) {
    const CoderPtr coder = coderWith(u"ab", {2, 1});
    EXPECT_EQ(codeText(*coder, u'a'), "1");
    EXPECT_EQ(codeText(*coder, u'b'), "0");
    EXPECT_EQ(coder->getTreeString(), u"ba");
}

TEST(HuffmanCode, ARepeatedCharacterMakesTwoLeavesAndKeepsItsFirstCode) {
    // Merged: a (1) and b (2) to 3, that and c (4) to 7, a (5) and that.
    const CoderPtr coder = coderWith(u"abca", {1, 2, 4, 5});
    EXPECT_EQ(coder->nodes.size(), 7U);
    EXPECT_EQ(coder->getTreeString(), u"aabc");
    EXPECT_EQ(coder->codes.size(), 3U);
    EXPECT_EQ(bitText(coder->getBoolTree()), "0100111");
    EXPECT_EQ(codeText(*coder, u'a'), "0");
}

TEST(HuffmanCode, AnyCodeUnitCanHaveACode) {
    const std::u16string characters{u'\0', u'\xD800', u'\xDC00', u'\xFFFF'};
    const CoderPtr coder = coderWith(characters, {1, 1, 1, 1});
    EXPECT_EQ(codeText(*coder, u'\0'), "00");
    EXPECT_EQ(codeText(*coder, u'\xDC00'), "01");
    EXPECT_EQ(codeText(*coder, u'\xD800'), "10");
    EXPECT_EQ(codeText(*coder, u'\xFFFF'), "11");
    EXPECT_EQ(coder->getTreeString().size(), 4U);
}

TEST(HuffmanCode, ANaNBehavesLikeATie) {
    const double nan = std::numeric_limits<double>::quiet_NaN();
    const CoderPtr coder = coderWith(u"abcd", {nan, 1, 1, nan});
    const model::Code expected = model::buildCode(u"abcd", {nan, 1, 1, nan});
    EXPECT_EQ(coder->getBoolTree(), expected.shape);
    EXPECT_EQ(coder->getTreeString(), expected.leaves);
}

// ---- The tree ----

TEST(HuffmanCode, TheTreeOfNLeavesHasItsRootLast) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    ASSERT_EQ(coder->nodes.size(), 9U);
    EXPECT_EQ(coder->rootIndex, 8);
    EXPECT_EQ(coder->nodes[8].frequency, 12);
    EXPECT_EQ(support::brokenInvariant(*coder), "");
}

TEST(HuffmanCode, LeavesEnterTheTreeWhenTheyAreFirstTaken) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    std::u16string order;
    for (const tessel::HNode& node : coder->nodes)
        order.push_back(node.isLeaf() ? node.character : u'-');
    EXPECT_EQ(order, u"bc-a-");
}

TEST(HuffmanCode, InnerNodesHaveNoCharacterAndTheSumOfTheirChildren) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    for (const tessel::HNode& node : coder->nodes) {
        if (node.isLeaf()) continue;
        const auto left = static_cast<std::size_t>(node.left);
        const auto right = static_cast<std::size_t>(node.right);
        EXPECT_EQ(node.character, 0);
        EXPECT_EQ(node.frequency,
                  coder->nodes[left].frequency + coder->nodes[right].frequency);
    }
}

TEST(HuffmanCode, TheComparatorPutsTheGreaterFrequencyBelow) {
    const tessel::HNodeFrequencyComparator below;
    tessel::HNode rare;
    rare.frequency = 1;
    rare.character = u'z';
    tessel::HNode frequent;
    frequent.frequency = 2;
    frequent.character = u'a';
    EXPECT_TRUE(below(frequent, rare));
    EXPECT_FALSE(below(rare, frequent));
    EXPECT_FALSE(below(rare, rare));
}

TEST(HuffmanCode, ParentOfNamesEveryNodesParentButTheRoots) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    ASSERT_EQ(coder->parentOf.size(), coder->nodes.size());
    for (const tessel::HNode& node : coder->nodes) {
        const auto at = static_cast<std::size_t>(node.index);
        if (node.index == coder->rootIndex) {
            EXPECT_EQ(coder->parentOf[at], -1);
            continue;
        }
        const auto parent = static_cast<std::size_t>(coder->parentOf[at]);
        EXPECT_TRUE(coder->nodes[parent].left == node.index ||
                    coder->nodes[parent].right == node.index);
    }
}

TEST(HuffmanCode, TraverseVisitsInPreOrderLeftBeforeRight) {
    const CoderPtr coder = coderWith(u"abcd", {1, 1, 1, 1});
    std::u16string seen;
    coder->traverse([&seen](HuffmanPathTree*, tessel::HNode& node) {
        seen.push_back(node.isLeaf() ? node.character : u'-');
    });
    EXPECT_EQ(seen, u"--ac-bd");
}

TEST(HuffmanCode, AVisitorCannotChangeTheTree) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    int visits = 0;
    coder->traverse([&visits](HuffmanPathTree*, tessel::HNode& node) {
        ++visits;
        node = tessel::HNode();
    });
    EXPECT_EQ(visits, 5);
    EXPECT_EQ(coder->nodes[static_cast<std::size_t>(coder->rootIndex)].left, 3);
    EXPECT_EQ(support::brokenInvariant(*coder), "");
}

TEST(HuffmanCode, AVisitorsExceptionPassesThrough) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    EXPECT_THROW(coder->traverse([](HuffmanPathTree*, tessel::HNode&) {
        throw std::runtime_error("enough");
    }),
                 std::runtime_error);
}

// ---- The code table ----

TEST(HuffmanCode, GeneratingTheCodeAgainKeepsTheTable) {
    const CoderPtr coder = coderWith(u"abcd", {1, 1, 1, 1});
    coder->generateCode();
    EXPECT_EQ(coder->codes.size(), 4U);
    EXPECT_EQ(codeText(*coder, u'a'), "00");
    EXPECT_EQ(codeText(*coder, u'c'), "01");
    EXPECT_EQ(codeText(*coder, u'b'), "10");
    EXPECT_EQ(codeText(*coder, u'd'), "11");
}

TEST(HuffmanCode, AddCodeKeepsTheCodeThatACharacterHas) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    tessel::HNode other = coder->nodes[0];  // the leaf b
    other.character = u'a';
    coder->addCode(other);
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(coder->codes.size(), 3U);
}

// Whatever a second tree in the same coder leads to, the codes stay, as long
// as they stand in the table.
TEST(HuffmanCode, CodesOfAnEarlierTreeStay) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    const double frequencies[] = {1, 1};
    coder->makeHeapAndTree(frequencies, u"xy");
    coder->generateCode();
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(codeText(*coder, u'b'), "10");
    EXPECT_EQ(codeText(*coder, u'c'), "11");
    EXPECT_EQ(coder->generateCodeFor(u"cab"), (support::Bytes{0b01011, 5}));
}

TEST(HuffmanCode, ACharacterWithoutALeafHasNoCode) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    EXPECT_THROW(coder->codeOf(u'd'), tessel::CodeNotFoundException);
    EXPECT_THROW(coder->codeOf(u'\x161'), tessel::CodeNotFoundException);
}

TEST(HuffmanCode, CodesOfAllLengthsUpToManyHundredBits) {
    std::u16string characters;
    Frequencies frequencies;
    for (int i = 0; i < 300; ++i) {
        characters.push_back(static_cast<char16_t>(u'a' + i));
        frequencies.push_back(std::ldexp(1.0, i));
    }
    const CoderPtr coder = coderWith(characters, frequencies);
    const model::Code expected = model::buildCode(characters, frequencies);
    std::size_t longest = 0;
    for (const char16_t character : characters) {
        EXPECT_EQ(coder->codeOf(character), expected.codes.at(character));
        longest = std::max(longest, coder->codeOf(character).size());
    }
    EXPECT_EQ(longest, 299U);
}

// ---- From a map ----

TEST(HuffmanCode, AMapGivesTheCodeOfItsOwnOrder) {
    const std::unordered_map<char16_t, double> map = {
        {u'a', 5}, {u'b', 1}, {u'c', 2}, {u'd', 1}, {u'e', 3}, {u'f', 1}};
    std::u16string characters;
    Frequencies frequencies;
    for (const auto& [character, frequency] : map) {
        characters.push_back(character);
        frequencies.push_back(frequency);
    }
    HuffmanPathTree coder;
    coder.deflateHuffman(map);
    const model::Code expected = model::buildCode(characters, frequencies);
    EXPECT_EQ(coder.getBoolTree(), expected.shape);
    EXPECT_EQ(coder.getTreeString(), expected.leaves);
    EXPECT_EQ(coder.getFrequencies(), expected.frequencies);
    for (const char16_t character : characters)
        EXPECT_EQ(coder.codeOf(character), expected.codes.at(character));
}

TEST(HuffmanCode, MakeHeapAndTreeFromAMapBuildsTheSameTreeAsDeflate) {
    const std::unordered_map<char16_t, double> map = {
        {u'x', 1}, {u'y', 1}, {u'z', 1}};
    HuffmanPathTree deflated;
    deflated.deflateHuffman(map);
    HuffmanPathTree made;
    made.makeHeapAndTree(map);
    EXPECT_TRUE(made.getFrequencies().empty());
    made.generateCompressedTree();
    EXPECT_EQ(made.getTreeString(), deflated.getTreeString());
    EXPECT_EQ(made.getBoolTree(), deflated.getBoolTree());
}

// ---- Fewer than two characters ----

TEST(HuffmanCode, WithoutCharactersThereIsNoCode) {
    HuffmanPathTree coder;
    coder.deflateHuffman(nullptr, u"");
    EXPECT_EQ(coder.rootIndex, -1);
    EXPECT_TRUE(coder.nodes.empty());
    EXPECT_TRUE(coder.getBoolTree().empty());
    EXPECT_EQ(coder.codes.size(), 0U);
    EXPECT_THROW(coder.generateCodeFor(u"a"), tessel::CodeNotFoundException);
}

TEST(HuffmanCode, OfASingleCharacterThereIsNoCode) {
    const CoderPtr coder = coderWith(u"a", {1});
    EXPECT_EQ(coder->rootIndex, -1);
    EXPECT_TRUE(coder->nodes.empty());
    EXPECT_TRUE(coder->getBoolTree().empty());
    EXPECT_TRUE(coder->getTreeString().empty());
    EXPECT_THROW(coder->generateCodeFor(u"a"), tessel::CodeNotFoundException);
}

TEST(HuffmanCode, AnEmptyMapGivesNoCode) {
    HuffmanPathTree coder;
    coder.deflateHuffman(std::unordered_map<char16_t, double>());
    EXPECT_EQ(coder.rootIndex, -1);
    EXPECT_THROW(coder.generateCodeFor(u"a"), tessel::CodeNotFoundException);
}

TEST(HuffmanCode, AQueueOfOneNodeMakesItTheRoot) {
    HuffmanPathTree coder;
    HuffmanPathTree::HeapQueue queue;
    tessel::HNode node;
    node.index = 3;
    queue.push(node);
    coder.generateTree(queue);
    EXPECT_EQ(coder.rootIndex, 3);
    EXPECT_TRUE(coder.nodes.empty());
}

TEST(HuffmanCode, ACoderThatGotNoCodeCanStillGetOne) {
    const CoderPtr coder = coderWith(u"a", {1});
    const double frequencies[] = {2, 1, 1};
    coder->deflateHuffman(frequencies, u"abc");
    EXPECT_EQ(codeText(*coder, u'b'), "10");
    EXPECT_THROW(coder->deflateHuffman(frequencies, u"abc"), std::logic_error);
}

TEST(HuffmanCode, TraversingWithoutATreeVisitsNothing) {
    HuffmanPathTree fresh;
    const CoderPtr single = coderWith(u"a", {1});
    for (HuffmanPathTree* coder : {&fresh, single.get()}) {
        bool visited = false;
        coder->traverse(
            [&visited](HuffmanPathTree*, tessel::HNode&) { visited = true; });
        EXPECT_FALSE(visited);
        coder->generateCode();
        coder->generateCompressedTree();
        EXPECT_TRUE(coder->getBoolTree().empty());
    }
}

// ---- A second build ----

TEST(HuffmanCode, ASecondDeflateIsRefusedAndChangesNothing) {
    const CoderPtr coder = coderWith(u"abcd", {1, 1, 1, 1});
    const Frequencies other = {9, 5, 1};
    EXPECT_THROW(coder->deflateHuffman(other.data(), u"xyz"), std::logic_error);
    EXPECT_THROW(coder->deflateHuffman({{u'x', 1.0}, {u'y', 2.0}}),
                 std::logic_error);
    EXPECT_EQ(bitText(coder->getBoolTree()), "0011011");
    EXPECT_EQ(coder->getTreeString(), u"acbd");
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{1, 1, 1, 1}));
    EXPECT_EQ(coder->nodes.size(), 7U);
    EXPECT_EQ(coder->rootIndex, 6);
    EXPECT_EQ(coder->codes.size(), 4U);
    EXPECT_EQ(codeText(*coder, u'd'), "11");
}

TEST(HuffmanCode, DeflateIsRefusedAfterInflate) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    const CoderPtr coder =
        support::restoredFrom(support::formOf(*source, true), true, *source);
    const Frequencies other = {9, 5, 1};
    EXPECT_THROW(coder->deflateHuffman(other.data(), u"xyz"), std::logic_error);
    EXPECT_EQ(coder->getTreeString(), u"acbd");
    EXPECT_EQ(codeText(*coder, u'c'), "01");
}

TEST(HuffmanCode, DeflateIsRefusedOnAShapeThatWasRead) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    support::Bytes form = support::formOf(*source, false);
    HuffmanPathTree coder;
    coder.deserialize(form, false);
    const Frequencies other = {9, 5, 1};
    EXPECT_THROW(coder.deflateHuffman(other.data(), u"xyz"), std::logic_error);
    EXPECT_TRUE(coder.nodes.empty());
    EXPECT_EQ(bitText(coder.getBoolTree()), "0011011");
    coder.inflateHuffman(u"acbd");
    EXPECT_EQ(codeText(coder, u'c'), "01");
}

// ---- Frequencies ----

TEST(HuffmanCode, SetFrequenciesTakesTheListOver) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    Frequencies list = {7, 8, 9};
    coder->setFrequencies(list);
    EXPECT_TRUE(list.empty());
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{7, 8, 9}));
    EXPECT_EQ(codeText(*coder, u'b'), "1");
    EXPECT_EQ(coder->getTreeString(), u"ab");
}

TEST(HuffmanCode, MakeHeapAndTreeEmptiesTheFrequencies) {
    HuffmanPathTree coder;
    Frequencies old = {1, 2, 3};
    coder.setFrequencies(old);
    const Frequencies frequencies = {1, 1};
    coder.makeHeapAndTree(frequencies.data(), u"ab");
    EXPECT_TRUE(coder.getFrequencies().empty());
    EXPECT_EQ(coder.nodes.size(), 3U);
}

// ---- Copies ----

TEST(HuffmanCode, CopyTreeToItselfKeepsTheCodeAndMakesAFreshPathTree) {
    const CoderPtr coder = coderWith(u"abcd", {1, 1, 1, 1});
    support::addBatch(*coder, {u"a"}, {u"b", u"c"});
    const tessel::BPathTree* before = coder->pathTree.get();
    const tessel::BNodePtr root = coder->pathTree->root;
    const support::Bytes form = support::formOf(*coder, false);
    coder->copyTree(*coder);
    EXPECT_NE(coder->pathTree.get(), before);
    EXPECT_TRUE(coder->pathTree->root == root);
    EXPECT_EQ(support::formOf(*coder, false), form);
    EXPECT_EQ(codeText(*coder, u'c'), "01");
    EXPECT_EQ(coder->partitionTracks.size(), 1U);
    EXPECT_EQ(support::iterated(*coder).size(), 2U);
}

TEST(HuffmanCode, CopyTreeToItselfKeepsEveryPartOfTheCode) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    const auto parents = coder->parentOf;
    coder->copyTree(*coder);
    EXPECT_EQ(codeText(*coder, u'a'), "0");
    EXPECT_EQ(codeText(*coder, u'e'), "10");
    EXPECT_EQ(codeText(*coder, u'c'), "110");
    EXPECT_EQ(codeText(*coder, u'b'), "1110");
    EXPECT_EQ(codeText(*coder, u'd'), "1111");
    EXPECT_EQ(coder->codes.size(), 5U);
    EXPECT_EQ(bitText(coder->getBoolTree()), "010101011");
    EXPECT_EQ(coder->getTreeString(), u"aecbd");
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{5, 3, 2, 1, 1}));
    EXPECT_EQ(coder->nodes.size(), 9U);
    EXPECT_EQ(coder->rootIndex, 8);
    EXPECT_EQ(coder->parentOf, parents);
    EXPECT_EQ(support::brokenInvariant(*coder), "");
}

TEST(HuffmanCode, ACopyHasTheCodeTheCountersAndThePaths) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    support::addBatch(*source, {u"a"}, {u"b", u"c"});
    support::addBatch(*source, {u"a"}, {u"d"});
    support::addWhole(*source, {u"b"});
    support::addWhole(*source, {u"b"});
    HuffmanPathTree copy;
    copy.copyTree(*source);
    EXPECT_EQ(copy.getBoolTree(), source->getBoolTree());
    EXPECT_EQ(copy.getTreeString(), source->getTreeString());
    EXPECT_EQ(copy.getFrequencies(), source->getFrequencies());
    EXPECT_EQ(copy.rootIndex, source->rootIndex);
    EXPECT_EQ(copy.nodes.size(), source->nodes.size());
    EXPECT_EQ(copy.parentOf, source->parentOf);
    EXPECT_EQ(copy.pathCount, 5U);
    EXPECT_EQ(copy.duplicates, source->duplicates);
    EXPECT_EQ(copy.partitionEnds, source->partitionEnds);
    EXPECT_EQ(copy.partitionTracks, source->partitionTracks);
    EXPECT_EQ(copy.maxCodeBytes, source->maxCodeBytes);
    EXPECT_EQ(copy.maxPartitionTrackLength, source->maxPartitionTrackLength);
    EXPECT_EQ(copy.maxDuplicateTrackLength, source->maxDuplicateTrackLength);
    EXPECT_EQ(copy.maxDuplicatePathNumber, source->maxDuplicatePathNumber);
    EXPECT_EQ(support::formOf(copy, false), support::formOf(*source, false));
    EXPECT_EQ(support::iterated(copy), support::iterated(*source));
    EXPECT_EQ(codeText(copy, u'c'), "01");
    EXPECT_THROW(copy.deflateHuffman({{u'x', 1.0}, {u'y', 2.0}}),
                 std::logic_error);
}

TEST(HuffmanCode, ACopyReplacesWhatTheCoderHeld) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    const CoderPtr target = coderWith(u"xyz", {1, 2, 3});
    support::addBatch(*target, {u"x"}, {u"y", u"z"});
    target->copyTree(*source);
    EXPECT_EQ(target->getTreeString(), u"acbd");
    EXPECT_EQ(target->pathCount, 0U);
    EXPECT_TRUE(target->partitionEnds.empty());
    EXPECT_TRUE(target->partitionTracks.empty());
    EXPECT_TRUE(support::iterated(*target).empty());
    EXPECT_THROW(target->codeOf(u'x'), tessel::CodeNotFoundException);
    EXPECT_EQ(target->generatePathFrom(target->generateCodeFor(u"dab")),
              u"dab");
}

TEST(HuffmanCode, ACopySharesTheNodesAndHasAPassOfItsOwn) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    support::addBatch(*source, {u"a"}, {u"b", u"c", u"d"});
    source->resetPathsToBTree();
    tessel::Components path;
    source->getNextPathFromBTree(path);
    HuffmanPathTree copy;
    copy.copyTree(*source);
    EXPECT_EQ(copy.pathTree->root, source->pathTree->root);
    EXPECT_EQ(copy.nextPathNumber, 1U);
    copy.getNextPathFromBTree(path);
    EXPECT_EQ(support::decodedBy(copy, path), (support::Texts{u"a", u"c"}));
    source->getNextPathFromBTree(path);
    EXPECT_EQ(support::decodedBy(copy, path), (support::Texts{u"a", u"c"}));
}

TEST(HuffmanCode, AddingToOneOfTwoCopiesLeavesTheOthersNumbersAsTheyWere) {
    const CoderPtr source = coderWith(u"abcd", {1, 1, 1, 1});
    support::addBatch(*source, {u"a"}, {u"b", u"c"});
    HuffmanPathTree copy;
    copy.copyTree(*source);
    support::addBatch(copy, {u"a"}, {u"d"});
    EXPECT_EQ(source->pathCount, 2U);
    EXPECT_EQ(copy.pathCount, 3U);
    EXPECT_EQ(support::iterated(*source).size(), 3U);
    const auto before = support::found(*source, {1, 2, 3});
    ASSERT_TRUE(before);
    ASSERT_EQ(before->files.size(), 1U);
    EXPECT_EQ(support::decodedBy(*source, before->files[0]),
              (support::Texts{u"b", u"c"}));
}

// ---- Life of an object ----

TEST(HuffmanCode, AFreshCoderIsEmpty) {
    const HuffmanPathTree coder;
    EXPECT_TRUE(coder.boolTree.empty());
    EXPECT_TRUE(coder.treeString.empty());
    ASSERT_NE(coder.pathTree, nullptr);
    EXPECT_TRUE(coder.pathTree->root->isLeaf());
    EXPECT_TRUE(coder.duplicates.empty());
    EXPECT_TRUE(coder.partitionEnds.empty());
    EXPECT_TRUE(coder.partitionTracks.empty());
    EXPECT_EQ(coder.maxPartitionTrackLength, 0U);
    EXPECT_EQ(coder.maxDuplicateTrackLength, 0U);
    EXPECT_EQ(coder.maxCodeBytes, 0U);
    EXPECT_EQ(coder.maxDuplicatePathNumber, 0U);
    EXPECT_EQ(coder.nextPathNumber, 0U);
    EXPECT_EQ(coder.pathCount, 0U);
    EXPECT_EQ(coder.rootIndex, 0);
    EXPECT_FALSE(coder.hasNextPathFromBTree());
}

TEST(HuffmanCode, OnlyTheDestructorIsVirtual) {
    EXPECT_TRUE(std::has_virtual_destructor_v<HuffmanPathTree>);
    EXPECT_TRUE(std::has_virtual_destructor_v<tessel::BPathTree>);
    EXPECT_FALSE(std::is_polymorphic_v<tessel::HNode>);
    EXPECT_FALSE(std::is_polymorphic_v<tessel::BNode>);
}

}  // namespace
