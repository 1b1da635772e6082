// Texts to bits and back, for every kind of code.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <cmath>

#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using tessel::HuffmanPathTree;
using Frequencies = std::vector<double>;

std::u16string withoutRepetition(const std::u16string& text) {
    std::u16string characters;
    for (const char16_t character : text)
        if (characters.find(character) == std::u16string::npos)
            characters.push_back(character);
    return characters;
}

// At least two different characters.
rc::Gen<std::u16string> anyAlphabet() {
    return rc::gen::map(
        rc::gen::container<std::u16string>(support::anyCodeUnit()),
        [](const std::u16string& text) {
            return withoutRepetition(text + u"ab");
        });
}

// The code's nodes as the reference walks them.
std::vector<model::CodeNode> nodesOf(const HuffmanPathTree& coder) {
    std::vector<model::CodeNode> nodes;
    for (const tessel::HNode& node : coder.nodes)
        nodes.push_back({node.frequency, node.character, node.index, node.left,
                         node.right});
    return nodes;
}

// The decoder must say what walking the tree bit by bit says.
void compareWithWalk(const HuffmanPathTree& coder, const Bytes& bytes) {
    const auto expected = model::decode(nodesOf(coder), coder.rootIndex, bytes);
    if (expected)
        RC_ASSERT(coder.generatePathFrom(bytes) == *expected);
    else
        RC_ASSERT_THROWS_AS(coder.generatePathFrom(bytes),
                            tessel::DamagedFormException);
}

RC_GTEST_PROP(ComponentDecoder, GivesBackWhatWasEncoded, ()) {
    const auto characters = *anyAlphabet();
    const auto frequencies = *rc::gen::container<Frequencies>(
        characters.size(), support::anyFrequency());
    const CoderPtr coder = support::coderWith(characters, frequencies);
    const auto text = *support::anyTextOf(rc::gen::elementOf(characters));
    const Bytes bytes = coder->generateCodeFor(text);
    RC_ASSERT(
        bytes ==
        model::encode(model::buildCode(characters, frequencies), text).bytes);
    RC_ASSERT(coder->maxCodeBytes == bytes.size());
    RC_ASSERT(coder->generatePathFrom(bytes) == text);
    compareWithWalk(*coder, bytes);

    HuffmanPathTree loaded;
    loaded.boolTree = coder->getBoolTree();
    loaded.inflateHuffman(coder->getTreeString());
    RC_ASSERT(loaded.generateCodeFor(text) == bytes);
    RC_ASSERT(loaded.generatePathFrom(bytes) == text);
}

RC_GTEST_PROP(ComponentDecoder, OfAnyBytesIsTheWalkOfTheirBits, ()) {
    const auto characters = *anyAlphabet();
    const auto frequencies = *rc::gen::container<Frequencies>(
        characters.size(), support::anyFrequency());
    const CoderPtr coder = support::coderWith(characters, frequencies);
    auto bytes = *rc::gen::container<Bytes>(support::anyByte());
    compareWithWalk(*coder, bytes);
    bytes.push_back(*rc::gen::inRange<std::uint8_t>(0, 8));
    compareWithWalk(*coder, bytes);
}

RC_GTEST_PROP(ComponentDecoder, InATreeWithHolesIsTheWalkOfItsBits, ()) {
    HuffmanPathTree coder;
    coder.boolTree = *rc::gen::container<std::vector<bool>>(
        rc::gen::weightedElement<bool>({{3, false}, {2, true}}));
    coder.setTreeString(std::u16string(coder.boolTree.size(), u'x'));
    for (std::size_t i = 0; i < coder.treeString.size(); ++i)
        coder.treeString[i] = static_cast<char16_t>(u'a' + i);
    coder.inflate();
    coder.generateCode();
    auto bytes = *rc::gen::container<Bytes>(support::anyByte());
    bytes.push_back(*rc::gen::inRange<std::uint8_t>(0, 8));
    compareWithWalk(coder, bytes);
}

// Codes from one bit to hundreds, across the bounds of every fast route.
struct LongCodes {
    CoderPtr coder;
    model::Code expected;
    std::u16string characters;
};

LongCodes longCodes(std::size_t count, double factor) {
    LongCodes codes;
    Frequencies frequencies;
    double frequency = 1;
    for (std::size_t i = 0; i < count; ++i) {
        codes.characters.push_back(static_cast<char16_t>(u'!' + 3 * i));
        frequencies.push_back(frequency);
        frequency *= factor;
    }
    codes.coder = support::coderWith(codes.characters, frequencies);
    codes.expected = model::buildCode(codes.characters, frequencies);
    return codes;
}

TEST(ComponentDecoder, EveryCharacterOfALongCodeAloneAndBetweenOthers) {
    for (const double factor : {1.5, 1.6180339887498949, 2.0}) {
        const LongCodes codes = longCodes(150, factor);
        for (std::size_t i = 0; i < codes.characters.size(); ++i) {
            const char16_t rare = codes.characters[i];
            const char16_t common = codes.characters.back();
            EXPECT_EQ(codes.coder->codeOf(rare), codes.expected.codes.at(rare));
            for (const std::u16string& text :
                 {std::u16string{rare}, std::u16string{common, rare, common},
                  std::u16string{rare, rare, rare},
                  std::u16string(i % 13, common) + rare +
                      std::u16string(i % 11, common) + rare}) {
                const Bytes bytes = codes.coder->generateCodeFor(text);
                EXPECT_EQ(bytes, model::encode(codes.expected, text).bytes);
                EXPECT_EQ(codes.coder->generatePathFrom(bytes), text);
            }
        }
    }
}

TEST(ComponentDecoder, CodesAroundTheLongestThatTheTableHolds) {
    const LongCodes codes = longCodes(100, 2);
    // A word of 64 bits, less the 7 that may wait and one to spare.
    constexpr unsigned longest = 56;
    bool seen[100] = {};
    for (const char16_t character : codes.characters) {
        const std::size_t length = codes.coder->codeOf(character).size();
        const auto& entry = codes.coder->codes[character];
        EXPECT_EQ(entry.isLong, length > longest);
        if (!entry.isLong) {
            EXPECT_EQ(entry.length, length);
        }
        seen[length] = true;
    }
    EXPECT_TRUE(seen[longest] && seen[longest + 1]);
}

RC_GTEST_PROP(ComponentDecoder, GivesBackTextsInLongCodes, ()) {
    static const LongCodes codes = longCodes(120, 2);
    const auto text = *support::anyTextOf(rc::gen::weightedOneOf<char16_t>(
        {{1, rc::gen::elementOf(codes.characters)},
         {3, rc::gen::elementOf(codes.characters.substr(108))}}));
    const Bytes bytes = codes.coder->generateCodeFor(text);
    RC_ASSERT(bytes == model::encode(codes.expected, text).bytes);
    RC_ASSERT(codes.coder->generatePathFrom(bytes) == text);
}

TEST(ComponentDecoder, AllCodeUnitsInOneCode) {
    std::u16string characters;
    for (unsigned unit = 0; unit <= 0xFFFF; ++unit)
        characters.push_back(static_cast<char16_t>(unit));
    const CoderPtr coder =
        support::coderWith(characters, Frequencies(characters.size(), 1));
    EXPECT_EQ(coder->codes.size(), 0x10000U);
    const Bytes bytes = coder->generateCodeFor(characters);
    EXPECT_EQ(bytes.size(), 2 * 0x10000U + 2);
    EXPECT_EQ(coder->generatePathFrom(bytes), characters);
}

// Every length of a text, so that its end meets every place in a byte and in
// the decoder's windows.
TEST(ComponentDecoder, TextsOfEveryLength) {
    const CoderPtr coder =
        support::coderWith(u"abcdefg", {40, 20, 9, 5, 3, 2, 1});
    const model::Code expected =
        model::buildCode(u"abcdefg", {40, 20, 9, 5, 3, 2, 1});
    std::u16string text;
    unsigned state = 1;
    for (int i = 0; i < 600; ++i) {
        state = state * 1103515245 + 12345;
        const unsigned weight = (state >> 16) % 8;
        text.push_back(u"aaabbcdg"[weight]);
        const Bytes bytes = coder->generateCodeFor(text);
        ASSERT_EQ(bytes, model::encode(expected, text).bytes);
        ASSERT_EQ(coder->generatePathFrom(bytes), text);
    }
}

// ---- Examples ----

TEST(ComponentDecoder, WhatWasEncodedWithEachWorkedExampleComesBack) {
    struct Example {
        std::u16string characters;
        std::vector<double> frequencies;
    };
    const Example examples[] = {{u"abc", {2, 1, 1}},
                                {u"abcd", {1, 1, 1, 1}},
                                {u"abcde", {5, 1, 2, 1, 3}}};
    for (const Example& example : examples) {
        const CoderPtr coder =
            support::coderWith(example.characters, example.frequencies);
        std::u16string whole;
        for (const char16_t character : example.characters) {
            const std::u16string single(1, character);
            EXPECT_EQ(coder->generatePathFrom(coder->generateCodeFor(single)),
                      single);
            whole += single + example.characters;
            EXPECT_EQ(coder->generatePathFrom(coder->generateCodeFor(whole)),
                      whole);
        }
    }
}

TEST(ComponentDecoder, TheTrailerAloneIsTheEmptyText) {
    const CoderPtr coder = support::fourLetterCoder();
    for (std::uint8_t trailer = 0; trailer < 8; ++trailer)
        EXPECT_EQ(coder->generatePathFrom({trailer}), u"");
    EXPECT_EQ(HuffmanPathTree().generatePathFrom({0}), u"");
}

TEST(ComponentDecoder, BitsAfterTheLastWholeCodeAreIgnored) {
    const CoderPtr coder = support::fourLetterCoder();
    EXPECT_EQ(coder->generatePathFrom({0b0111, 3}), u"d");
    EXPECT_EQ(coder->generatePathFrom({0b1, 1}), u"");
}

TEST(ComponentDecoder, UnusedHighBitsDoNotMatter) {
    const CoderPtr coder = support::fourLetterCoder();
    EXPECT_EQ(coder->generatePathFrom({0b11111101, 2}), u"b");
    EXPECT_EQ(coder->generatePathFrom({0xFF, 0xFF, 0}), u"dddd");
}

TEST(ComponentDecoder, AnEmptyVectorIsRefused) {
    EXPECT_THROW(support::fourLetterCoder()->generatePathFrom({}),
                 tessel::DamagedFormException);
    EXPECT_THROW(HuffmanPathTree().generatePathFrom({}),
                 tessel::DamagedFormException);
}

TEST(ComponentDecoder, ATrailerAboveSevenIsRefused) {
    const CoderPtr coder = support::fourLetterCoder();
    for (unsigned trailer = 8; trailer < 256; ++trailer) {
        const auto last = static_cast<std::uint8_t>(trailer);
        EXPECT_THROW(coder->generatePathFrom({last}),
                     tessel::DamagedFormException);
        EXPECT_THROW(coder->generatePathFrom({0x00, last}),
                     tessel::DamagedFormException);
    }
}

TEST(ComponentDecoder, BitsWithoutACodeAreRefused) {
    EXPECT_THROW(HuffmanPathTree().generatePathFrom({0x00, 1}),
                 tessel::DamagedFormException);
    EXPECT_THROW(support::coderWith(u"a", {1})->generatePathFrom({0x00, 1}),
                 tessel::DamagedFormException);
}

TEST(ComponentDecoder, ATreeThatIsOneLeafGivesACharacterForEachBit) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    EXPECT_EQ(coder.generatePathFrom({0}), u"");
    EXPECT_EQ(coder.generatePathFrom({0x05, 3}), u"aaa");
    EXPECT_EQ(coder.generatePathFrom({0x00, 0x00, 0}), u"aaaaaaaa");
}

TEST(ComponentDecoder, AppendingKeepsWhatTheTextHeld) {
    const CoderPtr coder = support::fourLetterCoder();
    std::u16string text = u"before ";
    coder->appendPathFrom(coder->generateCodeFor(u"dab"), text);
    EXPECT_EQ(text, u"before dab");
}

TEST(ComponentDecoder, ARefusedAppendLeavesTheTextAsItWas) {
    HuffmanPathTree coder;
    coder.boolTree = support::bitsOf("001");  // a = 00, all else is missing
    coder.setTreeString(u"a");
    coder.inflate();
    coder.generateCode();
    std::u16string text = u"before";
    EXPECT_THROW(coder.appendPathFrom(Bytes{0b100, 3}, text),
                 tessel::DamagedFormException);
    EXPECT_EQ(text, u"before");
    EXPECT_THROW(coder.appendPathFrom(Bytes{}, text),
                 tessel::DamagedFormException);
    EXPECT_EQ(text, u"before");
}

TEST(ComponentDecoder, ALeafIsAppendedAndTheWalkReturnsToTheRoot) {
    const CoderPtr coder = support::coderWith(u"abc", {2, 1, 1});
    std::u16string text = u"x";
    std::int32_t position = 0;  // the leaf b, which was taken first
    EXPECT_TRUE(coder->appendToPathIfLeaf(position, text));
    EXPECT_EQ(text, u"xb");
    EXPECT_EQ(position, coder->rootIndex);
    EXPECT_FALSE(coder->appendToPathIfLeaf(position, text));
    EXPECT_EQ(text, u"xb");
    EXPECT_EQ(position, coder->rootIndex);
}

TEST(ComponentDecoder, APositionThatIsNoNodeIsRefused) {
    const CoderPtr coder = support::coderWith(u"abc", {2, 1, 1});
    std::u16string text;
    for (std::int32_t position : {-1, 5, 1000, std::int32_t{-2147483647}}) {
        EXPECT_THROW(coder->appendToPathIfLeaf(position, text),
                     tessel::DamagedFormException);
    }
    EXPECT_EQ(text, u"");
}

}  // namespace
