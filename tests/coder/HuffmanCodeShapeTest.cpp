// The tree of the code as shape bits and tree string, and back.

#include <gtest/gtest.h>

#include <stdexcept>

#include "tests/support/Coders.hpp"

namespace {

using support::bitsOf;
using support::bitText;
using support::CoderPtr;
using support::coderWith;
using support::codeText;
using tessel::HuffmanPathTree;
using Frequencies = std::vector<double>;

TEST(CompactForm, TheWorkedExampleInPreOrder) {
    const CoderPtr coder = coderWith(u"abcde", {5, 1, 2, 1, 3});
    EXPECT_EQ(bitText(coder->getBoolTree()), "010101011");
    EXPECT_EQ(coder->getTreeString(), u"aecbd");
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{5, 3, 2, 1, 1}));
}

TEST(CompactForm, AShapeAndItsStringRebuildTheTree) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    coder.inflateHuffman(u"abc");
    EXPECT_EQ(coder.rootIndex, 0);
    ASSERT_EQ(coder.nodes.size(), 5U);
    EXPECT_EQ(coder.nodes[0].left, 1);
    EXPECT_EQ(coder.nodes[0].right, 2);
    EXPECT_EQ(coder.nodes[1].character, u'a');
    EXPECT_EQ(coder.nodes[2].left, 3);
    EXPECT_EQ(coder.nodes[2].right, 4);
    EXPECT_EQ(coder.nodes[3].character, u'b');
    EXPECT_EQ(coder.nodes[4].character, u'c');
    EXPECT_EQ(codeText(coder, u'a'), "0");
    EXPECT_EQ(codeText(coder, u'b'), "10");
    EXPECT_EQ(codeText(coder, u'c'), "11");
    EXPECT_EQ(support::brokenInvariant(coder), "");
}

TEST(CompactForm, EveryCharacterKeepsItsCodeThroughTheForm) {
    const CoderPtr source =
        coderWith(u"etaoinshrdlu", {12, 9, 8, 8, 7, 7, 6, 6, 6, 4, 4, 3});
    HuffmanPathTree loaded;
    loaded.boolTree = source->getBoolTree();
    loaded.inflateHuffman(source->getTreeString());
    for (const char16_t character : source->getTreeString())
        EXPECT_EQ(loaded.codeOf(character), source->codeOf(character));
    EXPECT_EQ(loaded.getTreeString(), source->getTreeString());
}

TEST(CompactForm, ARepeatedCharacterKeepsTheCodeOfItsFirstLeaf) {
    const CoderPtr source = coderWith(u"aabca", {1, 1, 1, 1, 1});
    HuffmanPathTree loaded;
    loaded.boolTree = source->getBoolTree();
    loaded.inflateHuffman(source->getTreeString());
    EXPECT_EQ(source->getTreeString().size(), 5U);
    EXPECT_EQ(loaded.codes.size(), 3U);
    for (const char16_t character : {u'a', u'b', u'c'})
        EXPECT_EQ(loaded.codeOf(character), source->codeOf(character));
}

TEST(CompactForm, ASingleLeafIsARootWithoutLinksAndWithAnEmptyCode) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("1");
    coder.inflateHuffman(u"a");
    EXPECT_EQ(coder.rootIndex, 0);
    ASSERT_EQ(coder.nodes.size(), 1U);
    EXPECT_TRUE(coder.nodes[0].isLeaf());
    EXPECT_EQ(codeText(coder, u'a'), "");
    EXPECT_EQ(coder.codes.size(), 1U);
}

TEST(CompactForm, InflateFromBoolTreeReturnsTheNumberOfLeaves) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    coder.setTreeString(u"abc");
    EXPECT_EQ(coder.inflateFromBoolTree(), 3U);
    ASSERT_EQ(coder.nodes.size(), 5U);
    for (std::size_t k = 0; k < 5; ++k) {
        EXPECT_EQ(coder.nodes[k].index, static_cast<std::int32_t>(k));
        EXPECT_EQ(coder.nodes[k].left, -1);
        EXPECT_EQ(coder.nodes[k].right, -1);
    }
    EXPECT_EQ(coder.nodes[0].character, 0);
    EXPECT_EQ(coder.nodes[3].character, u'b');
}

TEST(CompactForm, RebuiltNodesHaveNoFrequency) {
    const CoderPtr source = coderWith(u"abcde", {5, 1, 2, 1, 3});
    HuffmanPathTree loaded;
    loaded.boolTree = source->getBoolTree();
    loaded.inflateHuffman(source->getTreeString());
    for (const tessel::HNode& node : loaded.nodes) EXPECT_EQ(node.frequency, 0);
    EXPECT_TRUE(loaded.getFrequencies().empty());
    Frequencies frequencies = {4, 2};
    loaded.setFrequencies(frequencies);
    EXPECT_EQ(loaded.getFrequencies(), (Frequencies{4, 2}));
}

TEST(CompactForm, GeneratingTheFormTwiceAppendsItTwice) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    coder->generateCompressedTree();
    EXPECT_EQ(bitText(coder->getBoolTree()), "0101101011");
    EXPECT_EQ(coder->getTreeString(), u"abcabc");
    EXPECT_EQ(coder->getFrequencies(), (Frequencies{2, 1, 1, 2, 1, 1}));
}

TEST(CompactForm, TheGettersReturnCopies) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    coder->getBoolTree().push_back(true);
    coder->getTreeString().push_back(u'x');
    EXPECT_EQ(bitText(coder->getBoolTree()), "01011");
    EXPECT_EQ(coder->getTreeString(), u"abc");
}

TEST(CompactForm, SetTreeStringReplacesTheString) {
    HuffmanPathTree coder;
    coder.setTreeString(u"first");
    coder.setTreeString(u"second");
    EXPECT_EQ(coder.getTreeString(), u"second");
}

TEST(CompactForm, ADeepTreeIsRebuiltWithoutRecursion) {
    constexpr std::size_t leaves = 60000;
    HuffmanPathTree coder;
    std::u16string characters;
    for (std::size_t i = 0; i < leaves; ++i) {
        if (i + 1 < leaves) coder.boolTree.push_back(false);
        coder.boolTree.push_back(true);
        characters.push_back(static_cast<char16_t>(i));
    }
    coder.inflateHuffman(characters);
    EXPECT_EQ(coder.codeOf(u'\0').size(), 1U);
    EXPECT_EQ(coder.codeOf(static_cast<char16_t>(1000)).size(), 1001U);
    const std::vector<bool> last =
        coder.codeOf(static_cast<char16_t>(leaves - 1));
    EXPECT_EQ(last, std::vector<bool>(leaves - 1, true));
}

// ---- What does not fit together ----

TEST(CompactForm, ASecondInflateIsRefusedAndChangesNothing) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    coder.inflateHuffman(u"abc");
    EXPECT_THROW(coder.inflateHuffman(u"abc"), std::logic_error);
    EXPECT_THROW(coder.inflateHuffman(u"xyz"), std::logic_error);
    EXPECT_EQ(coder.nodes.size(), 5U);
    EXPECT_EQ(coder.getTreeString(), u"abc");
    EXPECT_EQ(codeText(coder, u'b'), "10");
}

TEST(CompactForm, InflateIsRefusedAfterDeflate) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    EXPECT_THROW(coder->inflateHuffman(u"abc"), std::logic_error);
    EXPECT_EQ(coder->nodes.size(), 5U);
    EXPECT_EQ(coder->rootIndex, 4);
}

TEST(CompactForm, AShortTreeStringIsRefusedAndChangesNothing) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    EXPECT_THROW(coder.inflateHuffman(u"ab"), tessel::DamagedFormException);
    EXPECT_TRUE(coder.nodes.empty());
    EXPECT_TRUE(coder.getTreeString().empty());
    coder.inflateHuffman(u"abc");
    EXPECT_EQ(codeText(coder, u'c'), "11");
}

TEST(CompactForm, ALongTreeStringIsRefusedAndChangesNothing) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    EXPECT_THROW(coder.inflateHuffman(u"abcd"), tessel::DamagedFormException);
    EXPECT_TRUE(coder.nodes.empty());
    coder.inflateHuffman(u"abc");
    EXPECT_EQ(codeText(coder, u'c'), "11");
}

TEST(CompactForm, NodesAreNotMadeFromAShortString) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("01011");
    coder.setTreeString(u"a");
    EXPECT_THROW(coder.inflateFromBoolTree(), tessel::DamagedFormException);
    EXPECT_THROW(coder.inflate(), tessel::DamagedFormException);
    EXPECT_TRUE(coder.nodes.empty());
}

TEST(CompactForm, AStringWithoutAShapeIsRefused) {
    HuffmanPathTree coder;
    EXPECT_THROW(coder.inflateHuffman(u"a"), tessel::DamagedFormException);
    EXPECT_TRUE(coder.nodes.empty());
}

TEST(CompactForm, NoShapeAndNoStringGiveNoCode) {
    HuffmanPathTree coder;
    coder.inflateHuffman(u"");
    EXPECT_EQ(coder.codes.size(), 0U);
    EXPECT_THROW(coder.generateCodeFor(u"a"), tessel::CodeNotFoundException);
}

TEST(CompactForm, AShapeWithTooFewNodesLeavesChildrenOut) {
    HuffmanPathTree coder;
    coder.boolTree = bitsOf("001");
    coder.setTreeString(u"a");
    coder.inflate();
    ASSERT_EQ(coder.nodes.size(), 3U);
    EXPECT_EQ(coder.nodes[0].left, 1);
    EXPECT_EQ(coder.nodes[0].right, -1);
    EXPECT_EQ(coder.nodes[1].left, 2);
    EXPECT_EQ(coder.nodes[1].right, -1);
    coder.generateCode();
    EXPECT_EQ(codeText(coder, u'a'), "00");
    EXPECT_EQ(coder.generatePathFrom({0x00, 2}), u"a");
    EXPECT_THROW(coder.generatePathFrom({0x01, 1}),
                 tessel::DamagedFormException);
}

// ---- Steps out of order ----

std::size_t nodesSeen(HuffmanPathTree& coder) {
    std::size_t seen = 0;
    coder.traverse([&seen](HuffmanPathTree*, tessel::HNode&) { ++seen; });
    return seen;
}

TEST(CompactForm, InflatingAfterACodeWasBuiltIsRefused) {
    const CoderPtr coder = support::fourLetterCoder();
    EXPECT_THROW(coder->inflate(), std::logic_error);
    EXPECT_EQ(coder->nodes.size(), 7U);
    EXPECT_EQ(nodesSeen(*coder), 7U);
    EXPECT_THROW(coder->inflateFromCompressedTree(), std::logic_error);
    coder->inflateFromBoolTree();
    EXPECT_THROW(coder->inflateFromCompressedTree(), std::logic_error);
    EXPECT_EQ(nodesSeen(*coder), 7U);
}

TEST(CompactForm, LinkingNodesThatWereNotMadeIsRefused) {
    HuffmanPathTree coder;
    coder.boolTree = {false, true, true};
    EXPECT_THROW(coder.inflateFromCompressedTree(), std::logic_error);
    EXPECT_EQ(nodesSeen(coder), 0U);
    coder.setTreeString(u"ab");
    coder.inflate();
    EXPECT_EQ(nodesSeen(coder), 3U);
    EXPECT_THROW(coder.inflateFromCompressedTree(), std::logic_error);
    EXPECT_EQ(nodesSeen(coder), 3U);
}

}  // namespace
