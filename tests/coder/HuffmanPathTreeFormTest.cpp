// The stored form of a coder, byte for byte.

#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>

#include "packing/sixpacks.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::append;
using support::Bytes;
using support::CoderPtr;
using support::coderWith;
using support::formOf;
using support::fourLetterCoder;
using support::join;
using support::restoredFrom;
using support::Texts;
using support::u64;
using tessel::Components;
using tessel::DamagedFormException;
using tessel::HuffmanPathTree;
using tessel::InvalidUintConversionException;
using tessel::PathTrack;
using Ends = std::vector<std::uint64_t>;

// A stored form without compression from its payload.
Bytes plainForm(std::initializer_list<Bytes> parts) {
    const Bytes payload = join(parts);
    return join({u64(payload.size()), payload});
}

// The shape 0 1 1 and one path of the component AB.
const Bytes shapeOfTwo = {2, 0, 0, 0, 0, 0, 0, 0, 0x06, 0x03};
const Bytes onePath = {
    1,    0,    0, 0, 0, 0, 0, 0, 0x00,  // one node code
    1,    0,    0, 0, 0, 0, 0, 0,        // one value
    0x00,                                // lengths take 1 byte
    1,    0xAB,                          // the value
};

void load(HuffmanPathTree& coder, Bytes form) {
    coder.deserialize(form, false);
}

// ---- Worked examples ----

TEST(CoderForm, TheWorkedExample) {
    HuffmanPathTree coder;
    coder.boolTree = support::bitsOf("011");
    Components path = {{0xAB}};
    coder.addPathToBTree(path);
    coder.maxCodeBytes = 1;
    EXPECT_EQ(formOf(coder, false),
              (Bytes{
                  0x1E, 0,    0, 0, 0, 0, 0, 0,        // payload length
                  0x02, 0,    0, 0, 0, 0, 0, 0, 6, 3,  // shape
                  0x01, 0,    0, 0, 0, 0, 0, 0, 0,     // node codes
                  0x01, 0,    0, 0, 0, 0, 0, 0,        // value count
                  0x00,                                // length width
                  0x01, 0xAB,                          // the value
              }));
}

TEST(CoderForm, TheWorkedExampleIsReadBack) {
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo, onePath}));
    EXPECT_EQ(support::bitText(coder.getBoolTree()), "011");
    EXPECT_EQ(coder.pathCount, 1U);
    EXPECT_EQ(coder.maxCodeBytes, 1U);
    EXPECT_EQ(support::storedTree(*coder.pathTree).second,
              (Components{{0xAB}}));
    EXPECT_EQ(formOf(coder, false), plainForm({shapeOfTwo, onePath}));
}

TEST(CoderForm, ACoderWithoutPaths) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    EXPECT_EQ(formOf(*coder, false),
              plainForm({shapeOfTwo, Bytes(8, 0), Bytes(8, 0), {0x00}}));
}

TEST(CoderForm, ACoderWithoutPathsIsReadBack) {
    for (const bool compress : {false, true}) {
        const CoderPtr coder = coderWith(u"ab", {1, 1});
        const CoderPtr back =
            restoredFrom(formOf(*coder, compress), compress, *coder);
        EXPECT_EQ(back->pathCount, 0U);
        EXPECT_TRUE(back->pathTree->root->isLeaf());
        EXPECT_TRUE(support::iterated(*back).empty());
        addBatch(*back, {u"a"}, {u"b"});
        EXPECT_EQ(support::iterated(*back), (std::vector<Texts>{{u"a", u"b"}}));
    }
}

TEST(CoderForm, ACoderThatNeverHadACode) {
    HuffmanPathTree coder;
    const Bytes form = formOf(coder, false);
    EXPECT_EQ(form, plainForm({Bytes(8, 0), Bytes(8, 0), Bytes(8, 0), {0}}));
    HuffmanPathTree back;
    load(back, form);
    EXPECT_EQ(back.pathCount, 0U);
    EXPECT_TRUE(back.getBoolTree().empty());
    back.inflateHuffman(u"");
    EXPECT_EQ(formOf(back, false), form);
}

TEST(CoderForm, WithoutCompressionThePayloadFollowsItsLength) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    const Bytes form = formOf(*coder, false);
    const Bytes length(form.begin(), form.begin() + 8);
    EXPECT_EQ(length, u64(form.size() - 8));
}

TEST(CoderForm, WithCompressionAStreamOfLevelNineFollows) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    const Bytes plain = formOf(*coder, false);
    const Bytes form = formOf(*coder, true);
    EXPECT_EQ(Bytes(form.begin(), form.begin() + 8),
              Bytes(plain.begin(), plain.begin() + 8));
    EXPECT_EQ(form[8], 0x78);
    EXPECT_EQ(form[9], 0xDA);
    Bytes payload(plain.begin() + 8, plain.end());
    EXPECT_EQ(Bytes(form.begin() + 8, form.end()),
              tessel::sixpacks::compressUint8(payload));
}

TEST(CoderForm, WritingAppendsAndChangesNothing) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    coder->resetPathsToBTree();
    const Bytes form = formOf(*coder, false);
    Bytes out = {0xEE};
    coder->serialize(out, false);
    EXPECT_EQ(out, join({{0xEE}, form}));
    Components path;
    coder->getNextPathFromBTree(path);
    EXPECT_EQ(support::decodedBy(*coder, path), (Texts{u"a", u"b"}));
}

TEST(CoderForm, EveryFieldOfACoderWithBothSections) {
    const CoderPtr coder = fourLetterCoder();  // a 00, c 01, b 10, d 11
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    addBatch(*coder, {u"a"}, {u"d"});
    addWhole(*coder, {u"b", u"a"});
    addWhole(*coder, {u"b", u"a"});
    EXPECT_EQ(formOf(*coder, false),
              plainForm({
                  u64(2),
                  {0b1101100, 7},  // shape 0011011
                  u64(6),
                  {3, 2, 2, 0, 1, 0},  // node codes
                  u64(6),
                  {0},                                   // values
                  {2, 0x00, 2, 2, 0x01, 2, 2, 0x02, 2},  // a, b, c
                  {2, 0x03, 2, 2, 0x01, 2, 2, 0x00, 2},  // d, b, a
                  {1},                                   // partitions
                  {0, 0},                                // widths of ends
                  {2, 2, 3},                             // ends
                  u64(2),
                  {0, 0},        // tracks, widths
                  {1, 0},        // a
                  {2, 0, 2},     // a, its third
                  {0},           // duplicates
                  {0, 0, 0},     // widths
                  {5, 2, 1, 0},  // path 5
              }));
}

TEST(CoderForm, TheExampleOfTheDocumentation) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    addBatch(*coder, {u"a"}, {u"b", u"ab"});
    addWhole(*coder, {u"b"});
    addWhole(*coder, {u"b"});
    const Bytes expected = join({
        {0x43, 0, 0, 0, 0, 0, 0, 0},
        {0x02, 0, 0, 0, 0, 0, 0, 0, 0x06, 0x03},
        {0x04, 0, 0, 0, 0, 0, 0, 0, 0x03, 0x02, 0x00, 0x00},
        {0x04, 0, 0, 0, 0, 0, 0, 0, 0x00},
        {2, 0x00, 1, 2, 0x01, 1, 2, 0x02, 2, 2, 0x01, 1},
        {0x01, 0, 0, 1, 2, 1, 0, 0, 0, 0, 0, 0, 0, 0, 0, 1, 0},
        {0x00, 0, 0, 0, 4, 1, 1},
    });
    EXPECT_EQ(expected.size(), 75U);
    EXPECT_EQ(formOf(*coder, false), expected);
    EXPECT_EQ(restoredFrom(expected, false, *coder)->pathCount, 3U);
}

// ---- Sections and what pathCount becomes ----

TEST(CoderForm, WholePathsWithoutARepetitionWriteNoSection) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    addWhole(*coder, {u"a", u"b"});
    addWhole(*coder, {u"b"});
    EXPECT_EQ(formOf(*coder, false), plainForm({shapeOfTwo,
                                                u64(3),
                                                {3, 0, 0},
                                                u64(3),
                                                {0},
                                                {2, 0, 1, 2, 1, 1, 2, 1, 1}}));
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    EXPECT_EQ(back->pathCount, 2U);
    EXPECT_TRUE(back->partitionTracks.empty());
    EXPECT_TRUE(back->duplicates.empty());
}

TEST(CoderForm, ARepeatedWholePathWritesOneEntryUnderItsNumber) {
    const CoderPtr coder = coderWith(u"ab", {1, 1});
    addWhole(*coder, {u"a"});
    addWhole(*coder, {u"a"});
    EXPECT_EQ(formOf(*coder, false), plainForm({shapeOfTwo,
                                                u64(1),
                                                {0},
                                                u64(1),
                                                {0},
                                                {2, 0, 1},
                                                {0x00, 0, 0, 0, 2, 1, 0}}));
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    EXPECT_EQ(back->pathCount, 2U);
    EXPECT_EQ(back->duplicates.at(2), PathTrack{0});
    EXPECT_EQ(back->maxDuplicatePathNumber, 2U);
    EXPECT_EQ(back->maxDuplicateTrackLength, 1U);
    EXPECT_EQ(support::iterated(*back), (std::vector<Texts>{{u"a"}, {u"a"}}));
}

TEST(CoderForm, WithPartitionsPathCountIsTheLastEnd) {
    const CoderPtr coder = fourLetterCoder();
    addWhole(*coder, {u"d"});
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    addWhole(*coder, {u"c"});
    ASSERT_EQ(coder->pathCount, 4U);
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    EXPECT_EQ(back->pathCount, 3U);
    EXPECT_EQ(back->partitionEnds, (Ends{3}));
}

TEST(CoderForm, WithBothSectionsTheDuplicatesAreAddedToTheLastEnd) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    addWhole(*coder, {u"c"});
    addWhole(*coder, {u"c"});
    addWhole(*coder, {u"c"});
    ASSERT_EQ(coder->pathCount, 5U);
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    EXPECT_EQ(back->pathCount, 4U);
}

TEST(CoderForm, ABatchWithoutFilesStillWritesItsPartition) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {});
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    EXPECT_EQ(back->partitionEnds, Ends{0});
    EXPECT_EQ(back->pathCount, 0U);
    EXPECT_EQ(support::tracksOf(*back), (std::vector<PathTrack>{{0}}));
}

TEST(CoderForm, AfterReadingMaxCodeBytesIsThatOfTheLongestStored) {
    const CoderPtr coder = fourLetterCoder();
    coder->generateCodeFor(std::u16string(4000, u'a'));
    addBatch(*coder, {u"a"}, {u"bcdab"});
    ASSERT_EQ(coder->maxCodeBytes, 1002U);
    const Bytes form = formOf(*coder, false);
    const CoderPtr back = restoredFrom(form, false, *coder);
    EXPECT_EQ(back->maxCodeBytes, 3U);
    EXPECT_EQ(form.size(), formOf(*back, false).size() + 2);
}

TEST(CoderForm, DuplicatesAreReadInAnyOrder) {
    const Bytes entries[] = {{2, 1, 0}, {5, 2, 0, 1}, {9, 1, 1}};
    const std::size_t orders[][3] = {{0, 1, 2}, {0, 2, 1}, {1, 0, 2},
                                     {1, 2, 0}, {2, 0, 1}, {2, 1, 0}};
    for (const auto& order : orders) {
        HuffmanPathTree coder;
        load(coder, plainForm({shapeOfTwo,
                               onePath,
                               {0x00, 0, 0, 0},
                               entries[order[0]],
                               entries[order[1]],
                               entries[order[2]]}));
        EXPECT_EQ(coder.duplicates.size(), 3U);
        EXPECT_EQ(coder.duplicates.at(2), PathTrack{0});
        EXPECT_EQ(coder.duplicates.at(5), (PathTrack{0, 1}));
        EXPECT_EQ(coder.duplicates.at(9), PathTrack{1});
        EXPECT_EQ(coder.maxDuplicatePathNumber, 9U);
        EXPECT_EQ(coder.maxDuplicateTrackLength, 2U);
        EXPECT_EQ(coder.pathCount, 4U);
    }
}

TEST(CoderForm, DuplicatesAreWrittenInTheOrderOfTheirNumbers) {
    const Bytes entries = {2, 1, 0, 5, 2, 0, 1, 9, 1, 1};
    const Bytes shuffled = {9, 1, 1, 2, 1, 0, 5, 2, 0, 1};
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo, onePath, {0x00, 0, 0, 0}, shuffled}));
    const Bytes form = formOf(coder, false);
    ASSERT_GT(form.size(), entries.size());
    EXPECT_TRUE(std::equal(entries.begin(), entries.end(), form.end() - 10));
}

TEST(CoderForm, OfTwoEntriesWithOneNumberTheLaterCounts) {
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo,
                           onePath,
                           {0x00, 0, 0, 0},
                           {7, 3, 1, 2, 3},
                           {7, 1, 0}}));
    EXPECT_EQ(coder.duplicates.size(), 1U);
    EXPECT_EQ(coder.duplicates.at(7), PathTrack{0});
    EXPECT_EQ(coder.maxDuplicateTrackLength, 3U);
    EXPECT_EQ(coder.pathCount, 2U);
}

TEST(CoderForm, EachWidthFollowsTheMaximumOfItsGroup) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<std::u16string> names;
    for (int i = 0; i < 300; ++i) names.push_back(u"a");
    addBatch(*coder, {u"b"}, names);
    addBatch(*coder, {u"b"}, {u"c"});
    // 301 paths and 301 children take two bytes, all else takes one.
    const Bytes form = formOf(*coder, false);
    const Bytes tail = join({
        {1, 1, 0},                    // widths of ends
        {2, 0x2C, 0x01, 0x2D, 0x01},  // 300, 301
        u64(2),
        {1, 0},                 // widths of tracks
        {1, 0, 0},              // b
        {2, 0, 0, 0x2C, 0x01},  // b, its 301st
    });
    ASSERT_GT(form.size(), tail.size());
    EXPECT_EQ(Bytes(form.end() - static_cast<std::ptrdiff_t>(tail.size()),
                    form.end()),
              tail);
}

TEST(CoderForm, TracksThatWereReadTakeNoSlack) {
    const CoderPtr coder = fourLetterCoder();
    for (int i = 0; i < 100; ++i) addBatch(*coder, {u"a", u"b"}, {u"c"});
    const CoderPtr back = restoredFrom(formOf(*coder, false), false, *coder);
    ASSERT_EQ(back->partitionTracks.size(), 100U);
    const tessel::PathTracks exact = back->partitionTracks;
    EXPECT_EQ(back->partitionTracks.memoryBytes(), exact.memoryBytes());
}

TEST(CoderForm, AnInsertionAfterReadingGoesOn) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    const CoderPtr back = restoredFrom(formOf(*coder, true), true, *coder);
    addBatch(*back, {u"a"}, {u"d"});
    EXPECT_EQ(back->partitionEnds, (Ends{2, 3}));
    EXPECT_EQ(back->partitionTracks[1], (PathTrack{0, 2}));
    const auto answer = support::found(*back, {1, 3});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*back, answer->files[1]), Texts{u"d"});
}

TEST(CoderForm, ReadingIntoACoderWithPartitionsAppendsThem) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a", u"a"}, {u"b", u"c"});
    addBatch(*coder, {u"a", u"a"}, {u"d"});
    Bytes form = formOf(*coder, false);
    coder->deserialize(form, false);
    EXPECT_EQ(coder->partitionEnds, (Ends{2, 3, 2, 3}));
    EXPECT_EQ(coder->partitionTracks.size(), 4U);
    EXPECT_EQ(coder->pathCount, 3U);
    EXPECT_EQ(support::codeText(*coder, u'c'), "01");
}

TEST(CoderForm, AMissingSectionLeavesItsMaximaAsTheyWere) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b"});
    addBatch(*coder, {u"a"}, {u"c"});
    addWhole(*coder, {u"a", u"b"});
    ASSERT_EQ(coder->maxPartitionTrackLength, 2U);
    load(*coder, plainForm({shapeOfTwo, onePath}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 2U);
    EXPECT_EQ(coder->maxDuplicateTrackLength, 2U);
    EXPECT_EQ(coder->maxDuplicatePathNumber, 3U);
    EXPECT_TRUE(coder->duplicates.empty());
    EXPECT_EQ(coder->pathCount, 1U);
}

TEST(CoderForm, ReadingDoesNotTouchTheCodeOrTheString) {
    const CoderPtr coder = fourLetterCoder();
    coder->nextPathNumber = 7;
    load(*coder, plainForm({shapeOfTwo, onePath}));
    EXPECT_EQ(coder->getTreeString(), u"acbd");
    EXPECT_EQ(coder->nodes.size(), 7U);
    EXPECT_EQ(support::codeText(*coder, u'b'), "10");
    EXPECT_EQ(coder->getFrequencies(), (std::vector<double>{1, 1, 1, 1}));
    EXPECT_EQ(coder->nextPathNumber, 7U);
    EXPECT_EQ(support::bitText(coder->getBoolTree()), "011");
}

TEST(CoderForm, ThePathTreesPartAlone) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    Bytes structure;
    Components values;
    EXPECT_EQ(coder->serializePathTree(structure, values), 2U);
    EXPECT_EQ(structure, (Bytes{1, 2, 0}));
    EXPECT_EQ(values, support::encodedBy(*coder, {u"a", u"b", u"c"}));
    const tessel::BPathTree* before = coder->pathTree.get();
    structure = {2, 2, 0};
    EXPECT_EQ(coder->deserializePathTree(structure, values), 3U);
    EXPECT_NE(coder->pathTree.get(), before);
    EXPECT_EQ(coder->pathCount, 3U);
}

// ---- Forms wider than the maxima say ----

TEST(CoderForm, ANewFolderOfManyComponentsIsWrittenReadable) {
    for (const std::size_t depth : {255U, 256U, 70000U}) {
        const CoderPtr coder = fourLetterCoder();
        const Texts folder(depth, u"a");
        addBatch(*coder, folder, {u"b"});
        EXPECT_EQ(coder->maxPartitionTrackLength, 0U);
        const Bytes form = formOf(*coder, false);
        const CoderPtr back = restoredFrom(form, false, *coder);
        EXPECT_EQ(back->partitionTracks[0], PathTrack(depth, 0));
        EXPECT_EQ(back->maxPartitionTrackLength, depth);
        EXPECT_EQ(formOf(*back, false), form);
        const auto answer = support::found(*back, {1});
        ASSERT_TRUE(answer);
        EXPECT_EQ(answer->folders[0].size(), depth);
    }
}

TEST(CoderForm, ARawComponentLongerThanAnyEncodedIsWrittenReadable) {
    for (const std::size_t length : {255U, 256U, 65536U}) {
        const CoderPtr coder = fourLetterCoder();
        Components folder = {Bytes(length, 0x5A)};
        Components files = {{1}};
        coder->addPathToBTree(folder, files);
        EXPECT_EQ(coder->maxCodeBytes, 0U);
        const Bytes form = formOf(*coder, false);
        const CoderPtr back = restoredFrom(form, false, *coder);
        EXPECT_EQ(support::storedTree(*back->pathTree).second,
                  (Components{Bytes(length, 0x5A), {1}}));
        EXPECT_EQ(back->maxCodeBytes, length);
    }
}

TEST(CoderForm, LargeNumbersThatWereReadAreWrittenAgain) {
    const Bytes form = plainForm({
        shapeOfTwo,
        onePath,
        {1, 3, 0},  // ends of 8 bytes
        {2},
        u64(0x123456789A),
        u64(1),  // falling ends
        u64(2),
        {3, 0},  // wide positions
        {1},
        u64(0x123456789A),
        {0},           // tracks
        {0, 3, 0, 3},  // duplicates
        u64(0x1122334455667788),
        {1},
        u64(0x99AABBCCDD),  // one entry
    });
    HuffmanPathTree coder;
    load(coder, form);
    EXPECT_EQ(coder.partitionEnds, (Ends{0x123456789A, 1}));
    EXPECT_EQ(coder.pathCount, 2U);
    EXPECT_EQ(coder.duplicates.at(0x1122334455667788), PathTrack{0x99AABBCCDD});
    EXPECT_EQ(formOf(coder, false), form);
}

// ---- Partition sections without ends ----

TEST(CoderForm, TracksWithoutEndsAreRead) {
    const Bytes twoPaths = join({
        u64(3),
        {1, 2, 0},  // a folder of two files
        u64(3),
        {0},  // values
        {2, 0, 1, 2, 0, 1, 2, 1, 1},
    });
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo,
                           twoPaths,
                           {1, 0, 0, 0},  // no ends
                           u64(2),
                           {0, 0},        // two tracks
                           {1, 0},        // the folder
                           {2, 0, 1}}));  // its second file
    coder.inflateHuffman(u"ab");
    EXPECT_TRUE(coder.partitionEnds.empty());
    EXPECT_EQ(support::tracksOf(coder), (std::vector<PathTrack>{{0}, {0, 1}}));
    EXPECT_EQ(coder.pathCount, 2U);
    EXPECT_EQ(coder.maxPartitionTrackLength, 2U);

    const auto answer = support::found(coder, {2, 1});
    ASSERT_TRUE(answer);
    ASSERT_EQ(answer->folders.size(), 2U);
    EXPECT_EQ(support::decodedBy(coder, answer->folders[0]),
              (Texts{u"a", u"b"}));
    EXPECT_EQ(support::decodedBy(coder, answer->folders[1]), Texts{u"a"});
    EXPECT_TRUE(answer->files.empty());
}

TEST(CoderForm, ASectionWithoutEndsLeavesPathCountAtTheLeaves) {
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo, onePath, {1, 0, 0, 0}, u64(0), {0, 0}}));
    EXPECT_EQ(coder.pathCount, 1U);
    EXPECT_TRUE(coder.partitionTracks.empty());
    HuffmanPathTree withDuplicate;
    load(withDuplicate, plainForm({shapeOfTwo,
                                   onePath,
                                   {1, 0, 0, 0},
                                   u64(1),
                                   {0, 0},
                                   {1, 0},
                                   {0, 0, 0, 0, 2, 1, 0}}));
    EXPECT_EQ(withDuplicate.pathCount, 2U);
}

TEST(CoderForm, TracksWithoutEndsAreWrittenAgain) {
    const Bytes form =
        plainForm({shapeOfTwo, onePath, {1, 0, 0, 0}, u64(1), {0, 0}, {1, 0}});
    HuffmanPathTree coder;
    load(coder, form);
    EXPECT_EQ(formOf(coder, false), form);
}

// ---- What a reader accepts, however odd ----

TEST(CoderForm, AnUnknownMarkerEndsReading) {
    for (unsigned marker = 2; marker < 256; ++marker) {
        HuffmanPathTree coder;
        load(coder, plainForm({shapeOfTwo,
                               onePath,
                               {static_cast<std::uint8_t>(marker)},
                               {9, 9, 9, 9}}));
        EXPECT_EQ(coder.pathCount, 1U);
        EXPECT_TRUE(coder.duplicates.empty());
        EXPECT_TRUE(coder.partitionTracks.empty());
    }
}

TEST(CoderForm, AnUnknownMarkerAfterThePartitionsEndsReading) {
    for (unsigned marker = 1; marker < 256; ++marker) {
        HuffmanPathTree coder;
        load(coder, plainForm({shapeOfTwo,
                               onePath,
                               {1, 0, 0, 1, 1},
                               u64(1),
                               {0, 0},
                               {1, 0},
                               {static_cast<std::uint8_t>(marker)},
                               {0, 0, 0, 2, 1, 0}}));
        EXPECT_EQ(coder.pathCount, 1U);
        EXPECT_EQ(coder.partitionEnds, Ends{1});
        EXPECT_TRUE(coder.duplicates.empty());
    }
}

TEST(CoderForm, AWidthThatIsNeverUsedMayHoldAnything) {
    HuffmanPathTree noValues;
    load(noValues, plainForm({shapeOfTwo, u64(0), u64(0), {0xFF}}));
    EXPECT_EQ(noValues.pathCount, 0U);

    HuffmanPathTree noTracks;
    load(noTracks,
         plainForm(
             {shapeOfTwo, onePath, {1, 0, 0, 1, 1}, u64(0), {0xFF, 0xFF}}));
    EXPECT_EQ(noTracks.partitionEnds, Ends{1});

    HuffmanPathTree noDuplicates;
    load(noDuplicates, plainForm({shapeOfTwo, onePath, {0, 0xFF, 0xFF, 0xFF}}));
    EXPECT_EQ(noDuplicates.pathCount, 1U);
    EXPECT_TRUE(noDuplicates.duplicates.empty());
}

TEST(CoderForm, ThePayloadLengthOfAPlainFormIsNotUsed) {
    Bytes form = plainForm({shapeOfTwo, onePath});
    for (const Bytes& length : {u64(0), u64(1), u64(~std::uint64_t{0})}) {
        std::copy(length.begin(), length.end(), form.begin());
        HuffmanPathTree coder;
        load(coder, form);
        EXPECT_EQ(coder.pathCount, 1U);
    }
}

TEST(CoderForm, MoreCodesAndValuesThanTheTreeHasAreIgnored) {
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo,
                           u64(3),
                           {0, 3, 9},  // complete at once
                           u64(2),
                           {0},
                           {1, 0xAB},        // the value
                           {3, 1, 2, 3}}));  // read, not used
    EXPECT_EQ(coder.pathCount, 1U);
    EXPECT_EQ(coder.maxCodeBytes, 3U);
    EXPECT_EQ(support::storedTree(*coder.pathTree).second,
              (Components{{0xAB}}));
}

TEST(CoderForm, AShapeBlockOfItsLastByteAloneIsNoShape) {
    HuffmanPathTree coder;
    load(coder, plainForm({u64(1), {0}, onePath}));
    EXPECT_TRUE(coder.getBoolTree().empty());
    EXPECT_EQ(coder.pathCount, 1U);
}

TEST(CoderForm, AShapeOfOneLeafIsRead) {
    HuffmanPathTree coder;
    load(coder, plainForm({u64(2), {1, 1}, onePath}));
    EXPECT_EQ(support::bitText(coder.getBoolTree()), "1");
    coder.inflateHuffman(u"a");
    EXPECT_EQ(support::codeText(coder, u'a'), "");
}

// ---- What a reader refuses ----

template <class Failure>
void expectRefused(const Bytes& form, bool compress = false) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    addWhole(*coder, {u"a", u"b"});
    const Bytes before = formOf(*coder, false);
    Bytes in = form;
    EXPECT_THROW(coder->deserialize(in, compress), Failure)
        << support::hex(form);
    EXPECT_EQ(formOf(*coder, false), before);
    EXPECT_EQ(coder->pathCount, 3U);
    EXPECT_EQ(support::iterated(*coder).size(), 3U);
}

TEST(CoderForm, AnEmptyFormIsDamaged) {
    expectRefused<DamagedFormException>({});
    expectRefused<DamagedFormException>({}, true);
    expectRefused<DamagedFormException>(Bytes(7, 0));
    expectRefused<DamagedFormException>(u64(0));
    expectRefused<DamagedFormException>(u64(0), true);
}

TEST(CoderForm, AShapeThatIsNoFullBinaryTreeIsDamaged) {
    const Bytes shapes[] = {
        {0b0, 1},        // an inner node alone
        {0b10, 2},       // its right child is missing
        {0b01, 2},       // a second root
        {0b110, 4},      // a node after the tree
        {0b0110, 4},     //
        {0b11, 2},       // two leaves
        {0xFF, 0, 0},    // eight leaves
        {0b011, 0b0, 0}  // eight bits of which a tree's are three
    };
    for (const Bytes& shape : shapes)
        expectRefused<DamagedFormException>(
            plainForm({u64(shape.size()), shape, onePath}));
}

TEST(CoderForm, AShapeBlockWithABadLastByteIsDamaged) {
    for (const std::uint8_t last : Bytes{8, 9, 0x80, 0xFF})
        expectRefused<DamagedFormException>(
            plainForm({u64(2), {0x06, last}, onePath}));
}

TEST(CoderForm, AnUnknownNodeCodeIsRefusedAsSuch) {
    expectRefused<tessel::UnknownNodeTypeException>(
        plainForm({shapeOfTwo, u64(1), {4}, u64(1), {0}, {1, 0xAB}}));
    expectRefused<tessel::UnknownNodeTypeException>(
        plainForm({shapeOfTwo, u64(2), {2, 0xFF}, u64(2), {0}, {1, 1, 1, 2}}));
}

TEST(CoderForm, ADamagedStreamIsReportedBeforeWhatItHolds) {
    // So much behind the unknown node that the damage is met only later.
    const Bytes plain = plainForm(
        {shapeOfTwo, u64(1), {4}, u64(1), {0}, {1, 0xAB}, Bytes(200'000, 9)});
    Bytes payload(plain.begin() + 8, plain.end());
    Bytes form = u64(payload.size());
    const Bytes stream = tessel::sixpacks::compressUint8(payload);
    form.insert(form.end(), stream.begin(), stream.end());
    expectRefused<tessel::UnknownNodeTypeException>(form, true);
    form.back() ^= 1;
    expectRefused<DamagedFormException>(form, true);
}

TEST(CoderForm, AnIncompleteTreeIsDamaged) {
    expectRefused<DamagedFormException>(
        plainForm({shapeOfTwo, u64(1), {1}, u64(1), {0}, {1, 0xAB}}));
    expectRefused<DamagedFormException>(
        plainForm({shapeOfTwo, u64(1), {2}, u64(1), {0}, {1, 0xAB}}));
}

TEST(CoderForm, FewerValuesThanNodesAreDamage) {
    expectRefused<DamagedFormException>(
        plainForm({shapeOfTwo, u64(2), {2, 0}, u64(1), {0}, {1, 0xAB}}));
    expectRefused<DamagedFormException>(
        plainForm({shapeOfTwo, u64(1), {0}, u64(0), {0}}));
}

TEST(CoderForm, ValuesWithoutNodesAreDamage) {
    expectRefused<DamagedFormException>(
        plainForm({shapeOfTwo, u64(0), u64(1), {0}, {1, 0xAB}}));
}

TEST(CoderForm, AnUnknownWidthIsRefusedWhenItIsUsed) {
    const Bytes forms[] = {
        plainForm({shapeOfTwo, u64(1), {0}, u64(1), {4}, {1, 0xAB}}),
        // ends, their count
        plainForm({shapeOfTwo, onePath, {1, 4, 0, 1, 1}, u64(0), {0, 0}}),
        plainForm({shapeOfTwo, onePath, {1, 0, 4, 1, 1}, u64(0), {0, 0}}),
        // positions, track lengths
        plainForm(
            {shapeOfTwo, onePath, {1, 0, 0, 1, 1}, u64(1), {4, 0}, {1, 0}}),
        plainForm(
            {shapeOfTwo, onePath, {1, 0, 0, 1, 1}, u64(1), {0, 0xFF}, {1, 0}}),
        // of duplicates: positions, track lengths, numbers
        plainForm({shapeOfTwo, onePath, {0, 4, 0, 0, 2, 1, 0}}),
        plainForm({shapeOfTwo, onePath, {0, 0, 4, 0, 2, 1, 0}}),
        plainForm({shapeOfTwo, onePath, {0, 0, 0, 4, 2, 1, 0}}),
    };
    for (const Bytes& form : forms)
        expectRefused<InvalidUintConversionException>(form);
}

TEST(CoderForm, AWidthOfAnEmptyListIsUsed) {
    // Ends, then a track's positions.
    expectRefused<InvalidUintConversionException>(
        plainForm({shapeOfTwo, onePath, {1, 4, 0, 0}, u64(0), {0, 0}}));
    expectRefused<InvalidUintConversionException>(
        plainForm({shapeOfTwo, onePath, {1, 0, 0, 1, 1}, u64(1), {4, 0}, {0}}));
    expectRefused<InvalidUintConversionException>(
        plainForm({shapeOfTwo, onePath, {0, 4, 0, 0, 2, 0}}));
}

TEST(CoderForm, AClaimThatGoesBeyondTheEndIsDamage) {
    const Bytes huge = u64(~std::uint64_t{0});
    const Bytes large = u64(std::uint64_t{1} << 40);
    for (const Bytes& claim : {huge, large, u64(100)}) {
        const Bytes forms[] = {
            plainForm({claim, {0x06, 0x03}, onePath}),
            plainForm({shapeOfTwo, claim, {0}, u64(1), {0}, {1, 0xAB}}),
            plainForm({shapeOfTwo, u64(1), {0}, claim, {0}, {1, 0xAB}}),
            plainForm({shapeOfTwo, u64(1), {0}, u64(1), {3}, claim, {0xAB}}),
            plainForm({shapeOfTwo, onePath, {1, 0, 3}, claim, {1}}),
            plainForm(
                {shapeOfTwo, onePath, {1, 0, 0, 1, 1}, claim, {0, 0}, {1, 0}}),
            plainForm({shapeOfTwo,
                       onePath,
                       {1, 0, 0, 1, 1},
                       u64(1),
                       {0, 3},
                       claim,
                       {0}}),
            plainForm({shapeOfTwo, onePath, {0, 0, 3, 0, 2}, claim, {0}}),
        };
        for (const Bytes& form : forms)
            expectRefused<DamagedFormException>(form);
    }
}

TEST(CoderForm, ACutEntryOfTheDuplicatesIsDamage) {
    const Bytes entry = {2, 0, 2, 0, 1, 0, 2, 0};  // number, track of two
    for (std::size_t length = 1; length < entry.size(); ++length) {
        const Bytes cut(entry.begin(),
                        entry.begin() + static_cast<std::ptrdiff_t>(length));
        expectRefused<DamagedFormException>(
            plainForm({shapeOfTwo, onePath, {0, 1, 1, 1}, entry, cut}));
    }
}

TEST(CoderForm, ACompressedBodyMustBeWhole) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    const Bytes form = formOf(*coder, true);
    for (std::size_t length = 0; length < form.size(); ++length)
        expectRefused<DamagedFormException>(
            Bytes(form.begin(),
                  form.begin() + static_cast<std::ptrdiff_t>(length)),
            true);
}

TEST(CoderForm, ACompressedBodyMustHaveTheLengthThatItSays) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    const Bytes form = formOf(*coder, true);
    const std::uint64_t length = formOf(*coder, false).size() - 8;
    for (const std::uint64_t claim :
         {std::uint64_t{0}, length - 1, length + 1, length * 2,
          std::uint64_t{1} << 40, ~std::uint64_t{0}}) {
        Bytes changed = u64(claim);
        changed.insert(changed.end(), form.begin() + 8, form.end());
        expectRefused<DamagedFormException>(changed, true);
    }
}

TEST(CoderForm, AFormReadWithTheWrongFlagIsDamage) {
    const CoderPtr coder = fourLetterCoder();
    addBatch(*coder, {u"a"}, {u"b", u"c"});
    expectRefused<DamagedFormException>(formOf(*coder, false), true);
    expectRefused<DamagedFormException>(formOf(*coder, true), false);
}

TEST(CoderForm, ACoderWithTwoShapesInARowIsNotWritten) {
    const CoderPtr coder = fourLetterCoder();
    coder->generateCompressedTree();
    Bytes out = {0xEE};
    EXPECT_THROW(coder->serialize(out, false), std::logic_error);
    EXPECT_EQ(out, Bytes{0xEE});
}

TEST(CoderForm, ATreeStringOfAnotherLengthIsRefusedAfterReading) {
    HuffmanPathTree coder;
    load(coder, plainForm({shapeOfTwo, onePath}));
    EXPECT_THROW(coder.inflateHuffman(u"a"), DamagedFormException);
    EXPECT_THROW(coder.inflateHuffman(u"abc"), DamagedFormException);
    coder.inflateHuffman(u"ab");
    EXPECT_EQ(support::codeText(coder, u'b'), "1");
}

// Whole paths raise the count beyond every end.
TEST(CoderForm, TheWidthOfEndsIsThatOfTheCountOfPaths) {
    const CoderPtr coder = support::fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b"});
    for (unsigned i = 0; i < 300; ++i) {
        tessel::Components path = {{1, 2},
                                   {static_cast<std::uint8_t>(i % 256),
                                    static_cast<std::uint8_t>(i / 256), 3}};
        coder->addPathToBTree(path);
    }
    const Bytes form = support::formOf(*coder, false);
    using tessel::sixpacks::PackedSizeT;
    tessel::sixpacks::ByteCursor cursor(form);
    cursor.take(8);
    tessel::sixpacks::unpackVector(cursor, PackedSizeT::Uint64);  // shape
    tessel::sixpacks::unpackVector(cursor, PackedSizeT::Uint64);  // codes
    const std::uint64_t values = cursor.takeUint(PackedSizeT::Uint64);
    ASSERT_EQ(cursor.takeByte(), 0U);
    for (std::uint64_t i = 0; i < values; ++i)
        tessel::sixpacks::unpackVector(cursor, PackedSizeT::Uint8);
    EXPECT_EQ(cursor.takeByte(), 1U);  // the marker of partitions
    EXPECT_EQ(cursor.takeByte(), 1U);  // 301 needs two bytes
    EXPECT_EQ(cursor.takeByte(), 0U);  // their count needs one
}

}  // namespace
