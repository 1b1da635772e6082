// Paths out of the coder: texts of components, iteration, lookup by number.

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <stdexcept>

#include "tests/support/Coders.hpp"

namespace {

using support::addBatch;
using support::addBatches;
using support::addWhole;
using support::Bytes;
using support::CoderPtr;
using support::coderWith;
using support::decodedBy;
using support::encodedBy;
using support::found;
using support::fourLetterCoder;
using support::Texts;
using tessel::Components;
using tessel::DamagedFormException;
using tessel::HuffmanPathTree;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// ---- Decoding ----

TEST(PathDecoding, WhatWasEncodedWithEachWorkedExampleComesBack) {
    struct Example {
        std::u16string characters;
        std::vector<double> frequencies;
    };
    const Example examples[] = {{u"abc", {2, 1, 1}},
                                {u"abcd", {1, 1, 1, 1}},
                                {u"abcde", {5, 1, 2, 1, 3}}};
    for (const Example& example : examples) {
        const CoderPtr coder =
            coderWith(example.characters, example.frequencies);
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

TEST(PathDecoding, TheTrailerAloneIsTheEmptyText) {
    const CoderPtr coder = fourLetterCoder();
    for (std::uint8_t trailer = 0; trailer < 8; ++trailer)
        EXPECT_EQ(coder->generatePathFrom({trailer}), u"");
    EXPECT_EQ(HuffmanPathTree().generatePathFrom({0}), u"");
}

TEST(PathDecoding, BitsBehindTheLastWholeCodeAreIgnored) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generatePathFrom({0b0111, 3}), u"d");
    EXPECT_EQ(coder->generatePathFrom({0b1, 1}), u"");
}

TEST(PathDecoding, UnusedHighBitsDoNotMatter) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generatePathFrom({0b11111101, 2}), u"b");
    EXPECT_EQ(coder->generatePathFrom({0xFF, 0xFF, 0}), u"dddd");
}

TEST(PathDecoding, AnEmptyVectorIsRefused) {
    EXPECT_THROW(fourLetterCoder()->generatePathFrom({}), DamagedFormException);
    EXPECT_THROW(HuffmanPathTree().generatePathFrom({}), DamagedFormException);
}

TEST(PathDecoding, ATrailerAboveSevenIsRefused) {
    const CoderPtr coder = fourLetterCoder();
    for (unsigned trailer = 8; trailer < 256; ++trailer) {
        const auto last = static_cast<std::uint8_t>(trailer);
        EXPECT_THROW(coder->generatePathFrom({last}), DamagedFormException);
        EXPECT_THROW(coder->generatePathFrom({0x00, last}),
                     DamagedFormException);
    }
}

TEST(PathDecoding, BitsWithoutACodeAreRefused) {
    EXPECT_THROW(HuffmanPathTree().generatePathFrom({0x00, 1}),
                 DamagedFormException);
    EXPECT_THROW(coderWith(u"a", {1})->generatePathFrom({0x00, 1}),
                 DamagedFormException);
}

TEST(PathDecoding, ATreeThatIsOneLeafGivesACharacterForEachBit) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    EXPECT_EQ(coder.generatePathFrom({0}), u"");
    EXPECT_EQ(coder.generatePathFrom({0x05, 3}), u"aaa");
    EXPECT_EQ(coder.generatePathFrom({0x00, 0x00, 0}), u"aaaaaaaa");
}

TEST(PathDecoding, AppendingKeepsWhatTheTextHeld) {
    const CoderPtr coder = fourLetterCoder();
    std::u16string text = u"before ";
    coder->appendPathFrom(coder->generateCodeFor(u"dab"), text);
    EXPECT_EQ(text, u"before dab");
}

TEST(PathDecoding, ARefusedAppendLeavesTheTextAsItWas) {
    HuffmanPathTree coder;
    coder.boolTree = support::bitsOf("001");  // a = 00, all else is missing
    coder.setTreeString(u"a");
    coder.inflate();
    coder.generateCode();
    std::u16string text = u"before";
    EXPECT_THROW(coder.appendPathFrom(Bytes{0b100, 3}, text),
                 DamagedFormException);
    EXPECT_EQ(text, u"before");
    EXPECT_THROW(coder.appendPathFrom(Bytes{}, text), DamagedFormException);
    EXPECT_EQ(text, u"before");
}

TEST(PathDecoding, ALeafIsAppendedAndTheWalkReturnsToTheRoot) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    std::u16string text = u"x";
    std::int32_t position = 0;  // the leaf b, which was taken first
    EXPECT_TRUE(coder->appendToPathIfLeaf(position, text));
    EXPECT_EQ(text, u"xb");
    EXPECT_EQ(position, coder->rootIndex);
    EXPECT_FALSE(coder->appendToPathIfLeaf(position, text));
    EXPECT_EQ(text, u"xb");
    EXPECT_EQ(position, coder->rootIndex);
}

TEST(PathDecoding, APositionThatIsNoNodeIsRefused) {
    const CoderPtr coder = coderWith(u"abc", {2, 1, 1});
    std::u16string text;
    for (std::int32_t position : {-1, 5, 1000, std::int32_t{-2147483647}}) {
        EXPECT_THROW(coder->appendToPathIfLeaf(position, text),
                     DamagedFormException);
    }
    EXPECT_EQ(text, u"");
}

// ---- Iteration ----

TEST(PathIteration, ResetStartsAgainFromTheFirstPath) {
    const CoderPtr coder = fourLetterCoder();
    addBatches(*coder, {{u"a"}, {u"b"}}, {{u"c", u"d"}, {u"c"}});
    const std::vector<Texts> expected = {
        {u"a", u"c"}, {u"a", u"d"}, {u"b", u"c"}};
    EXPECT_EQ(support::iterated(*coder), expected);
    EXPECT_FALSE(coder->hasNextPathFromBTree());
    EXPECT_EQ(support::iterated(*coder), expected);
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(coder->nextPathNumber, 1U);
    EXPECT_EQ(support::iterated(*coder), expected);
}

TEST(PathIteration, NoPathBeforeTheFirstReset) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b"});
    EXPECT_FALSE(coder->hasNextPathFromBTree());
    Components path;
    EXPECT_THROW(coder->getNextPathFromBTree(path),
                 tessel::NoMorePathException);
}

TEST(PathIteration, PastTheEndItThrows) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b"});
    support::iterated(*coder);
    Components path = {{1, 2, 3}};
    EXPECT_THROW(coder->getNextPathFromBTree(path),
                 tessel::NoMorePathException);
    EXPECT_EQ(path, (Components{{1, 2, 3}}));
}

TEST(PathIteration, ARepeatedWholePathComesBackAtItsOwnNumber) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"c"});
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"d"});
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a", u"b"}, {u"c"}, {u"a", u"b"}, {u"d"}}));
}

TEST(PathIteration, ADuplicateIsLeftEvenWhenTheTreeHasNoFurtherPath) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a"});
    addWhole(*coder, {u"a"});
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    EXPECT_FALSE(coder->pathTree->hasNextPath());
    EXPECT_TRUE(coder->hasNextPathFromBTree());
    path.clear();
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(decodedBy(*coder, path), Texts{u"a"});
    EXPECT_FALSE(coder->hasNextPathFromBTree());
}

TEST(PathIteration, AStoredPathReplacesWhatTheListHeldADuplicateIsAppended) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"a"});
    addWhole(*coder, {u"a"});
    coder->resetPathsToBTree();
    Components path = {{9}};
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(path, encodedBy(*coder, {u"a"}));
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(path, encodedBy(*coder, {u"a", u"a"}));
}

TEST(PathIteration, ResetClearsWhatWorkersLeftBehind) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> folders = {{u"a"}, {u"x"}};
    std::vector<Texts> files = {{u"b"}, {u"b"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, files),
                 tessel::CodeNotFoundException);
    coder->resetPathsToBTree();
    EXPECT_TRUE(coder->genThreads.empty());
    EXPECT_TRUE(coder->asyncFolders.empty());
    EXPECT_TRUE(coder->asyncFiles.empty());
    EXPECT_TRUE(coder->encodedFolders.empty());
    EXPECT_TRUE(coder->encodedFiles.empty());
}

// ---- Lookup by number ----

// Partition 0: a/{a,b,c}; partition 1: b/{a,d}; partition 2, which joins a:
// a/{aa,bb,cc,dd}. The ends are 3, 5 and 9.
CoderPtr threePartitions() {
    CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"a", u"b", u"c"});
    addBatch(*coder, {u"b"}, {u"a", u"d"});
    addBatch(*coder, {u"a"}, {u"aa", u"bb", u"cc", u"dd"});
    return coder;
}

struct Answer {
    std::vector<Texts> folders;
    std::vector<Texts> files;
    bool operator==(const Answer&) const = default;
};

// What getPath gives, as text.
Answer answerFor(const HuffmanPathTree& coder,
                 const std::vector<double>& numbers) {
    std::vector<Components> folders;
    std::vector<Components> files;
    coder.getPath(folders, files, numbers);
    Answer answer;
    for (const Components& folder : folders)
        answer.folders.push_back(decodedBy(coder, folder));
    for (const Components& names : files)
        answer.files.push_back(decodedBy(coder, names));
    return answer;
}

TEST(PathLookup, NumbersAreGroupedIntoPartitions) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(coder->partitionEnds, (std::vector<std::uint64_t>{3, 5, 9}));
    EXPECT_EQ(
        answerFor(*coder, {2, 3, 4, 8}),
        (Answer{{{u"a"}, {u"b"}, {u"a"}}, {{u"b", u"c"}, {u"a"}, {u"cc"}}}));
}

TEST(PathLookup, BothFilesOfTheSecondPartition) {
    EXPECT_EQ(answerFor(*threePartitions(), {4, 5}),
              (Answer{{{u"b"}}, {{u"a", u"d"}}}));
}

TEST(PathLookup, OneFileOfEachOfTwoPartitions) {
    EXPECT_EQ(answerFor(*threePartitions(), {1, 5}),
              (Answer{{{u"a"}, {u"b"}}, {{u"a"}, {u"d"}}}));
}

TEST(PathLookup, ANumberBehindTheLastPartitionEndsTheCollection) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(answerFor(*coder, {9, 10, 1}), (Answer{{{u"a"}}, {{u"dd"}}}));
    EXPECT_EQ(answerFor(*coder, {10, 1, 2}), Answer{});
    EXPECT_EQ(answerFor(*coder, {5, 1e300}), (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {5, 18446744073709551615.0}),
              (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {9223372036854775808.0}), Answer{});
}

TEST(PathLookup, InfinityCountsAsBehindTheLastPartition) {
    const CoderPtr coder = threePartitions();
    EXPECT_EQ(answerFor(*coder, {5, infinity}), (Answer{{{u"b"}}, {{u"d"}}}));
    EXPECT_EQ(answerFor(*coder, {infinity, nan, 0}), Answer{});
}

TEST(PathLookup, NumbersAreTruncated) {
    EXPECT_EQ(answerFor(*threePartitions(), {1.9, 4.999999, 5.5}),
              (Answer{{{u"a"}, {u"b"}}, {{u"a"}, {u"a", u"d"}}}));
}

TEST(PathLookup, ANumberMayRepeat) {
    EXPECT_EQ(answerFor(*threePartitions(), {2, 2, 2}),
              (Answer{{{u"a"}}, {{u"b", u"b", u"b"}}}));
}

TEST(PathLookup, NumbersOutOfOrderWithinAPartitionAreAnsweredInThatOrder) {
    EXPECT_EQ(answerFor(*threePartitions(), {9, 6, 7}),
              (Answer{{{u"a"}}, {{u"dd", u"aa", u"bb"}}}));
    EXPECT_EQ(answerFor(*threePartitions(), {3, 1}),
              (Answer{{{u"a"}}, {{u"c", u"a"}}}));
}

TEST(PathLookup, OutputsKeepWhatTheyHeld) {
    const CoderPtr coder = threePartitions();
    std::vector<Components> folders = {{{1}}};
    std::vector<Components> files = {{{2}}, {{3}}};
    coder->getPath(folders, files, {1});
    ASSERT_EQ(folders.size(), 2U);
    ASSERT_EQ(files.size(), 3U);
    EXPECT_EQ(folders[0], (Components{{1}}));
    EXPECT_EQ(files[1], (Components{{3}}));
    EXPECT_EQ(folders[1], encodedBy(*coder, {u"a"}));
}

TEST(PathLookup, NoNumbersGiveNoAnswer) {
    EXPECT_EQ(answerFor(*threePartitions(), {}), Answer{});
}

TEST(PathLookup, WithoutPartitionsNothingIsAppended) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(answerFor(*coder, {1, 2}), Answer{});
    addWhole(*coder, {u"a"});
    EXPECT_EQ(answerFor(*coder, {1, nan}), Answer{});
}

TEST(PathLookup, ALookupLeavesThePassAlone) {
    const CoderPtr coder = threePartitions();
    coder->resetPathsToBTree();
    Components path;
    coder->getNextPathFromBTree(path);
    answerFor(*coder, {1, 5, 9});
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(decodedBy(*coder, path), (Texts{u"a", u"b"}));
    EXPECT_EQ(coder->nextPathNumber, 2U);
}

// Asks with outputs that hold something, which a refusal must not change.
void expectRefused(const HuffmanPathTree& coder,
                   const std::vector<double>& numbers) {
    std::vector<Components> folders = {{{1}}};
    std::vector<Components> files = {{{2}}};
    EXPECT_THROW(coder.getPath(folders, files, numbers), std::out_of_range)
        << ::testing::PrintToString(numbers);
    EXPECT_EQ(folders, (std::vector<Components>{{{1}}}));
    EXPECT_EQ(files, (std::vector<Components>{{{2}}}));
}

TEST(PathLookup, ANumberThatIsNoneIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    for (const double number :
         {nan, 0.0, -0.0, -1.0, 0.5, 0.999, -1e300, -infinity}) {
        expectRefused(*coder, {number});
        expectRefused(*coder, {1, number});
        expectRefused(*coder, {1, 5, number});
        expectRefused(*coder, {number, infinity});
    }
}

// Such a number counts back from the partition's first file, so it gives a
// file that the folder got earlier, if there is one.
TEST(PathLookup, ANumberBeforeThePartitionAtHandCountsBackInItsFolder) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"a", u"b", u"c"});
    support::addBatch(*coder, {u"d"}, {u"a", u"b"});
    support::addBatch(*coder, {u"a"}, {u"aa", u"bb"});
    EXPECT_EQ(answerFor(*coder, {7, 5, 4}),
              (Answer{{{u"a"}}, {{u"bb", u"c", u"b"}}}));
    EXPECT_EQ(answerFor(*coder, {4, 6, 5, 7, 3}),
              (Answer{{{u"d"}, {u"a"}}, {{u"a"}, {u"aa", u"c", u"bb", u"a"}}}));
    expectRefused(*coder, {7, 2});
    expectRefused(*coder, {7, 0});
    expectRefused(*coder, {5, 3});
    expectRefused(*coder, {4, 0.5});
}

TEST(PathLookup, BothOutputsMayBeOneList) {
    const CoderPtr coder = threePartitions();
    std::vector<Components> folders;
    std::vector<Components> files;
    coder->getPath(folders, files, {1, 5, 9});
    std::vector<Components> both;
    coder->getPath(both, both, {1, 5, 9});
    ASSERT_EQ(both.size(), folders.size() + files.size());
    for (std::size_t i = 0; i < folders.size(); ++i) {
        EXPECT_EQ(both[2 * i], folders[i]);
        EXPECT_EQ(both[2 * i + 1], files[i]);
    }
    const auto before = both;
    EXPECT_THROW(coder->getPath(both, both, {1, 5, nan}), std::out_of_range);
    EXPECT_EQ(both, before);
}

TEST(PathLookup, ANumberThatLeadsOutsideTheTreeIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    coder->partitionEnds = {3, 8, 12};  // more than partition 1 has
    expectRefused(*coder, {6});
    expectRefused(*coder, {1, 8});
    EXPECT_EQ(answerFor(*coder, {5}), (Answer{{{u"b"}}, {{u"d"}}}));
}

TEST(PathLookup, ATrackThatLeadsOutsideTheTreeIsOutOfRange) {
    const CoderPtr coder = threePartitions();
    tessel::PathTracks tracks;
    tracks.push_back({0});
    tracks.push_back({2});
    tracks.push_back({0, 1, 0});
    coder->partitionTracks = tracks;
    expectRefused(*coder, {4});
    expectRefused(*coder, {1, 9});
    EXPECT_EQ(answerFor(*coder, {2}), (Answer{{{u"a"}}, {{u"b"}}}));
}

TEST(PathLookup, FewerTracksThanEndsAreOutOfRange) {
    const CoderPtr coder = threePartitions();
    tessel::PathTracks tracks;
    tracks.push_back({0});
    coder->partitionTracks = tracks;
    expectRefused(*coder, {4});
    EXPECT_EQ(answerFor(*coder, {2}), (Answer{{{u"a"}}, {{u"b"}}}));
}

// ---- Tracks without ends ----

CoderPtr trackOnly() {
    CoderPtr coder = threePartitions();
    coder->partitionEnds.clear();
    return coder;
}

TEST(PathLookup, WithoutEndsNumbersAreThoseOfPartitions) {
    const CoderPtr coder = trackOnly();
    // The third track ends at the first file of its batch.
    EXPECT_EQ(answerFor(*coder, {2, 1, 3}),
              (Answer{{{u"b"}, {u"a"}, {u"a", u"aa"}}, {}}));
}

TEST(PathLookup, WithoutEndsNumbersAreTruncatedAfterSubtractingOne) {
    const CoderPtr coder = trackOnly();
    EXPECT_EQ(answerFor(*coder, {1.9, 2.5}), (Answer{{{u"a"}, {u"b"}}, {}}));
    EXPECT_EQ(answerFor(*coder, {0.5}), (Answer{{{u"a"}}, {}}));
}

TEST(PathLookup, WithoutEndsANumberThatIsNoPartitionIsOutOfRange) {
    const CoderPtr coder = trackOnly();
    for (const double number : {nan, 0.0, -1.0, 4.0, 1e300, infinity})
        expectRefused(*coder, {1, number});
}

}  // namespace
