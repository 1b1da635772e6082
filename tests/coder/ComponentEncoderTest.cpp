// Texts to encoded components.

#include <gtest/gtest.h>

#include "tests/support/Coders.hpp"
#include "tests/support/Exceptions.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::fourLetterCoder;
using tessel::Components;
using tessel::HuffmanPathTree;

TEST(ComponentEncoder, OneCharacterIsItsCodePacked) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generateCodeFor(u"a"), (Bytes{0x00, 0x02}));
}

TEST(ComponentEncoder, CodesFollowEachOtherFromTheLowestBitUp) {
    const CoderPtr coder = fourLetterCoder();
    // d 11, c 01, b 10, a 00, d 11
    EXPECT_EQ(coder->generateCodeFor(u"dcbad"),
              (Bytes{0b00'01'10'11, 0b11, 2}));
}

TEST(ComponentEncoder, FullBytesAreFollowedByAnEmptyOne) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generateCodeFor(u"dddd"), (Bytes{0xFF, 0x00, 0x00}));
}

TEST(ComponentEncoder, AnEmptyComponentHasNoCode) {
    const CoderPtr coder = fourLetterCoder();
    try {
        coder->generateCodeFor(u"");
        FAIL() << "an empty text was encoded";
    } catch (const tessel::NoCodeForEmptyString& failure) {
        EXPECT_STREQ(failure.what(), "No code for an empty string.");
    }
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

TEST(ComponentEncoder, ACharacterOutsideTheAlphabetHasNoCode) {
    const CoderPtr coder = fourLetterCoder();
    try {
        coder->generateCodeFor(u"abxd");
        FAIL() << "an unknown character was encoded";
    } catch (const tessel::CodeNotFoundException& failure) {
        EXPECT_STREQ(failure.what(), "Code for the character not found.");
    }
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

TEST(ComponentEncoder, TheLongestComponentIsRemembered) {
    const CoderPtr coder = fourLetterCoder();
    coder->generateCodeFor(u"abcd");
    EXPECT_EQ(coder->maxCodeBytes, 3U);
    coder->generateCodeFor(u"a");
    EXPECT_EQ(coder->maxCodeBytes, 3U);
    coder->generateCodeFor(std::u16string(16, u'a'));
    EXPECT_EQ(coder->maxCodeBytes, 6U);
}

TEST(ComponentEncoder, ATreeThatIsOneLeafEncodesEveryTextToTheEmptyComponent) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    EXPECT_EQ(coder.generateCodeFor(u"a"), Bytes());
    EXPECT_EQ(coder.generateCodeFor(u"aaaa"), Bytes());
    EXPECT_EQ(coder.maxCodeBytes, 0U);
    EXPECT_THROW(coder.generateCodeFor(u"b"), tessel::CodeNotFoundException);
    EXPECT_THROW(coder.generateCodeFor(u""), tessel::NoCodeForEmptyString);
}

TEST(ComponentEncoder, ABatchOfACodeThatIsOneLeafIsStoredAndReadBack) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    support::addBatch(coder, {u"a", u"aa"}, {u"a", u"aaa"});
    EXPECT_EQ(coder.pathCount, 2U);
    const CoderPtr back =
        support::restoredFrom(support::formOf(coder, false), false, coder);
    EXPECT_EQ(support::formOf(*back, false), support::formOf(coder, false));
    Components path;
    back->resetPathsToBTree();
    back->getNextPathFromBTree(path);
    EXPECT_EQ(path, (Components{{}, {}, {}}));
}

TEST(ComponentEncoder, TheExceptionsDeriveFromTheStandardBaseAlone) {
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::NoCodeForEmptyString>());
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::CodeNotFoundException>());
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::DamagedFormException>());
    EXPECT_TRUE(support::derivesFromStandardBaseAlone<
                tessel::InvalidUintConversionException>());
}

}  // namespace
