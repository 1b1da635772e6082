// From texts to encoded components and into the tree: one component, a batch
// on workers, whole paths, and the bookkeeping of both.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <stdexcept>
#include <string>

#include "tests/support/Coders.hpp"
#include "tests/support/Exceptions.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::coderWith;
using support::fourLetterCoder;
using support::Texts;
using tessel::Components;
using tessel::HuffmanPathTree;
using tessel::PathTrack;
using Ends = std::vector<std::uint64_t>;
using Range = std::pair<std::uint64_t, std::uint64_t>;

constexpr unsigned threadCounts[] = {0, 1, 2, 3, 7, 64};

// ---- One component ----

TEST(PathEncoding, OneCharacterIsItsCodePacked) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generateCodeFor(u"a"), (Bytes{0x00, 0x02}));
}

TEST(PathEncoding, CodesFollowEachOtherFromTheLowestBitUp) {
    const CoderPtr coder = fourLetterCoder();
    // d 11, c 01, b 10, a 00, d 11
    EXPECT_EQ(coder->generateCodeFor(u"dcbad"),
              (Bytes{0b00'01'10'11, 0b11, 2}));
}

TEST(PathEncoding, FullBytesAreFollowedByAnEmptyOne) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->generateCodeFor(u"dddd"), (Bytes{0xFF, 0x00, 0x00}));
}

TEST(PathEncoding, AnEmptyComponentHasNoCode) {
    const CoderPtr coder = fourLetterCoder();
    try {
        coder->generateCodeFor(u"");
        FAIL() << "an empty text was encoded";
    } catch (const tessel::NoCodeForEmptyString& failure) {
        EXPECT_STREQ(failure.what(), "No code for an empty string.");
    }
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

TEST(PathEncoding, ACharacterOutsideTheAlphabetHasNoCode) {
    const CoderPtr coder = fourLetterCoder();
    try {
        coder->generateCodeFor(u"abxd");
        FAIL() << "an unknown character was encoded";
    } catch (const tessel::CodeNotFoundException& failure) {
        EXPECT_STREQ(failure.what(), "Code for the character not found.");
    }
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

TEST(PathEncoding, TheLongestComponentIsRemembered) {
    const CoderPtr coder = fourLetterCoder();
    coder->generateCodeFor(u"abcd");
    EXPECT_EQ(coder->maxCodeBytes, 3U);
    coder->generateCodeFor(u"a");
    EXPECT_EQ(coder->maxCodeBytes, 3U);
    coder->generateCodeFor(std::u16string(16, u'a'));
    EXPECT_EQ(coder->maxCodeBytes, 6U);
}

TEST(PathEncoding, ATreeThatIsOneLeafEncodesEveryTextToTheEmptyComponent) {
    HuffmanPathTree coder;
    coder.boolTree = {true};
    coder.inflateHuffman(u"a");
    EXPECT_EQ(coder.generateCodeFor(u"a"), Bytes());
    EXPECT_EQ(coder.generateCodeFor(u"aaaa"), Bytes());
    EXPECT_EQ(coder.maxCodeBytes, 0U);
    EXPECT_THROW(coder.generateCodeFor(u"b"), tessel::CodeNotFoundException);
    EXPECT_THROW(coder.generateCodeFor(u""), tessel::NoCodeForEmptyString);
}

TEST(PathEncoding, ABatchOfACodeThatIsOneLeafIsStoredAndReadBack) {
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

TEST(PathEncoding, TheExceptionsDeriveFromTheStandardBaseAlone) {
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::NoCodeForEmptyString>());
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::CodeNotFoundException>());
    EXPECT_TRUE(
        support::derivesFromStandardBaseAlone<tessel::DamagedFormException>());
    EXPECT_TRUE(support::derivesFromStandardBaseAlone<
                tessel::InvalidUintConversionException>());
}

// ---- How a batch is split ----

TEST(PathEncoding, TenFoldersOnFourThreadsLeaveTheRemainderToTheLast) {
    EXPECT_EQ(HuffmanPathTree::splitFolders(10, 4),
              (std::vector<Range>{{0, 1}, {2, 3}, {4, 5}, {6, 9}}));
}

TEST(PathEncoding, MoreThreadsThanFoldersGiveEachFolderAWorker) {
    EXPECT_TRUE(HuffmanPathTree::splitFolders(0, 4).empty());
    EXPECT_EQ(HuffmanPathTree::splitFolders(3, 8),
              (std::vector<Range>{{0, 0}, {1, 1}, {2, 2}}));
}

TEST(PathEncoding, AsManyThreadsAsFoldersGiveEachFolderAWorker) {
    const std::vector<Range> ranges = HuffmanPathTree::splitFolders(8, 8);
    ASSERT_EQ(ranges.size(), 8U);
    for (std::uint64_t w = 0; w < 8; ++w) EXPECT_EQ(ranges[w], Range(w, w));
}

TEST(PathEncoding, AnUnknownNumberOfThreadsCountsAsTwo) {
    EXPECT_EQ(HuffmanPathTree::splitFolders(5, 0),
              (std::vector<Range>{{0, 1}, {2, 4}}));
}

TEST(PathEncoding, EverySplitCoversEachFolderOnce) {
    for (std::uint64_t n = 1; n < 40; ++n) {
        for (unsigned threads = 0; threads < 40; ++threads) {
            const auto ranges = HuffmanPathTree::splitFolders(n, threads);
            EXPECT_EQ(ranges.size(),
                      std::min<std::uint64_t>(n, threads == 0 ? 2 : threads));
            std::uint64_t next = 0;
            for (const auto& [first, last] : ranges) {
                EXPECT_EQ(first, next);
                EXPECT_LE(first, last);
                next = last + 1;
            }
            EXPECT_EQ(next, n);
        }
    }
}

// ---- A batch ----

TEST(PathEncoding, ANewFoldersTrackHasOnePositionPerComponent) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c", u"d"});
    ASSERT_EQ(coder->partitionTracks.size(), 1U);
    EXPECT_EQ(coder->partitionTracks[0], (PathTrack{0, 0}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 0U);
    EXPECT_EQ(coder->partitionEnds, (Ends{2}));
    EXPECT_EQ(coder->pathCount, 2U);
}

TEST(PathEncoding, ANewFolderLeavesTheLongestPartitionTrackAsItWas) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c"});
    support::addBatch(*coder, {u"a", u"b"}, {u"d"});
    ASSERT_EQ(coder->maxPartitionTrackLength, 3U);
    support::addBatch(*coder, {u"d"}, {u"a"});
    EXPECT_EQ(coder->partitionTracks[2], (PathTrack{1}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
    support::addBatch(*coder, {u"c", u"a", u"b", u"d"}, {u"a"});
    EXPECT_EQ(coder->partitionTracks[3], (PathTrack{2, 0, 0, 0}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
}

TEST(PathEncoding, AStoredFoldersTrackEndsWithTheFirstNewFile) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a", u"b"}, {u"c", u"d"});
    support::addBatch(*coder, {u"a", u"b"}, {u"cc", u"dd", u"c"});
    ASSERT_EQ(coder->partitionTracks.size(), 2U);
    EXPECT_EQ(coder->partitionTracks[1], (PathTrack{0, 0, 2}));
    EXPECT_EQ(coder->maxPartitionTrackLength, 3U);
    EXPECT_EQ(coder->partitionEnds, (Ends{2, 5}));
    EXPECT_EQ(coder->pathCount, 5U);
}

TEST(PathEncoding, ASecondBatchAppendsAfterTheFirst) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatches(*coder, {{u"a"}, {u"b"}}, {{u"a"}, {u"b", u"c"}});
    support::addBatches(*coder, {{u"c"}, {u"d"}}, {{u"a"}, {u"b", u"c"}});
    EXPECT_EQ(coder->partitionEnds, (Ends{1, 3, 4, 6}));
    EXPECT_EQ(coder->pathCount, 6U);
}

TEST(PathEncoding, ABatchTakesBothListsOver) {
    const CoderPtr coder = fourLetterCoder();
    for (const std::size_t count : {1U, 5U}) {
        std::vector<Texts> folders(count, Texts{u"a"});
        std::vector<Texts> files(count, Texts{u"b"});
        coder->generateCodeAsyncAndAddPaths(folders, files);
        EXPECT_TRUE(folders.empty());
        EXPECT_TRUE(files.empty());
    }
    EXPECT_EQ(coder->pathCount, 6U);
    EXPECT_TRUE(coder->asyncFolders.empty());
    EXPECT_TRUE(coder->encodedFolders.empty());
    EXPECT_TRUE(coder->genThreads.empty());
}

TEST(PathEncoding, AFolderWithoutFilesIsAPartitionOfNoPaths) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatches(*coder, {{u"a"}, {u"b"}}, {{}, {u"c"}});
    EXPECT_EQ(coder->partitionEnds, (Ends{0, 1}));
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a"}, {u"b", u"c"}}));
}

TEST(PathEncoding, FilesWithoutAFolderGoUnderTheRoot) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {}, {u"a", u"b"});
    EXPECT_EQ(coder->partitionTracks[0], PathTrack{});
    EXPECT_EQ(support::iterated(*coder), (std::vector<Texts>{{u"a"}, {u"b"}}));
    const auto answer = support::found(*coder, {2});
    ASSERT_TRUE(answer);
    EXPECT_EQ(answer->folders, (std::vector<Components>{{}}));
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"b"});
}

TEST(PathEncoding, InsertionIsInInputOrderOnAnyNumberOfThreads) {
    std::vector<Texts> folders;
    std::vector<Texts> files;
    for (int i = 0; i < 50; ++i) {
        folders.push_back({u"a", std::u16string(std::size_t(i % 7 + 1), u'b')});
        files.push_back({std::u16string(std::size_t(i + 1), u'c'), u"d"});
    }
    const CoderPtr first = fourLetterCoder();
    support::addBatches(*first, folders, files, 1);
    for (const unsigned threads : threadCounts) {
        const CoderPtr coder = fourLetterCoder();
        support::addBatches(*coder, folders, files, threads);
        EXPECT_EQ(support::formOf(*coder, false),
                  support::formOf(*first, false));
        EXPECT_EQ(coder->maxCodeBytes, first->maxCodeBytes);
    }
}

TEST(PathEncoding, OneWorkersBodyFillsItsRangeOnly) {
    const CoderPtr coder = fourLetterCoder();
    coder->asyncFolders = {{u"a"}, {u"b"}, {u"c"}};
    coder->asyncFiles = {{u"a", u"b"}, {u"c"}, {}};
    coder->encodedFolders.resize(3);
    coder->encodedFiles.resize(3);
    coder->generateCodeForPath(1, 1);
    EXPECT_EQ(coder->encodedFolders[0].size(), 0U);
    EXPECT_EQ(coder->encodedFolders[1].size(), 1U);
    EXPECT_EQ(coder->encodedFiles[1].size(), 1U);
    EXPECT_EQ(coder->encodedFolders[2].size(), 0U);
    coder->generateCodeForPath(2, 1);
    EXPECT_EQ(coder->encodedFolders[2].size(), 0U);
    coder->generateCodeForPath(0, 0);
    coder->generateCodeForPath(2, 2);
    coder->addPathToBTreeFromAsyncData();
    EXPECT_EQ(
        support::iterated(*coder),
        (std::vector<Texts>{{u"a", u"a"}, {u"a", u"b"}, {u"b", u"c"}, {u"c"}}));
    EXPECT_TRUE(coder->asyncFolders.empty());
    EXPECT_TRUE(coder->encodedFiles.empty());
}

// ---- Refused batches ----

TEST(PathEncoding, ABatchOfNoFoldersReturnsAtOnce) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> none;
    coder->generateCodeAsyncAndAddPaths(none, none);
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_TRUE(coder->partitionEnds.empty());
    EXPECT_TRUE(coder->partitionTracks.empty());
}

TEST(PathEncoding, ARefusedFoldersTextsCanBeMendedAndTriedAgain) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> folders = {{u"a", u"b"}};
    std::vector<Texts> files = {{u"c", u"x"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, files),
                 tessel::CodeNotFoundException);
    EXPECT_EQ(coder->asyncFolders, (std::vector<Texts>{{u"a", u"b"}}));
    EXPECT_EQ(coder->asyncFiles, (std::vector<Texts>{{u"c", u"x"}}));
    coder->asyncFiles[0].pop_back();
    coder->generateCodeAsyncAndAddPaths(coder->asyncFolders, coder->asyncFiles);
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a", u"b", u"c"}}));
    EXPECT_TRUE(coder->asyncFolders.empty());
}

TEST(PathEncoding, OneListForFoldersAndFilesIsRefused) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> both = {{u"a"}, {u"b"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(both, both),
                 std::invalid_argument);
    EXPECT_EQ(both, (std::vector<Texts>{{u"a"}, {u"b"}}));
}

TEST(PathEncoding, ListsOfDifferentLengthAreRefusedAndNothingChanges) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b"});
    const Bytes before = support::formOf(*coder, false);
    std::vector<Texts> folders = {{u"a"}, {u"b"}};
    std::vector<Texts> files = {{u"c"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, files),
                 std::invalid_argument);
    EXPECT_EQ(folders, (std::vector<Texts>{{u"a"}, {u"b"}}));
    EXPECT_EQ(files, (std::vector<Texts>{{u"c"}}));
    std::vector<Texts> none;
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(none, files),
                 std::invalid_argument);
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, none),
                 std::invalid_argument);
    EXPECT_EQ(support::formOf(*coder, false), before);
    EXPECT_EQ(coder->pathCount, 1U);
}

// A batch of eight folders of which some cannot be encoded.
struct Batch {
    std::vector<Texts> folders = std::vector<Texts>(8, Texts{u"a", u"b"});
    std::vector<Texts> files = std::vector<Texts>(8, Texts{u"c", u"d"});
};

enum class Refused { no, emptyText, unknownCharacter, otherwise };

Refused refusalOf(HuffmanPathTree& coder, const Batch& batch,
                  unsigned threads) {
    try {
        support::addBatches(coder, batch.folders, batch.files, threads);
    } catch (const tessel::NoCodeForEmptyString&) {
        return Refused::emptyText;
    } catch (const tessel::CodeNotFoundException&) {
        return Refused::unknownCharacter;
    } catch (...) {
        return Refused::otherwise;
    }
    return Refused::no;
}

TEST(PathEncoding, TheFailureOfTheFirstFailingFolderIsThrown) {
    Batch batch;
    batch.folders[7] = {u""};
    batch.files[5] = {u"a", u""};
    batch.folders[3] = {u"x"};
    batch.files[3] = {u""};
    for (const unsigned threads : threadCounts) {
        const CoderPtr coder = fourLetterCoder();
        EXPECT_EQ(refusalOf(*coder, batch, threads), Refused::unknownCharacter)
            << threads << " threads";
    }
    batch.files[2] = {u"a", u""};
    for (const unsigned threads : threadCounts) {
        const CoderPtr coder = fourLetterCoder();
        EXPECT_EQ(refusalOf(*coder, batch, threads), Refused::emptyText)
            << threads << " threads";
    }
}

TEST(PathEncoding, ARefusedBatchInsertsNothingAndTheCoderCanBeUsedOn) {
    for (const unsigned threads : threadCounts) {
        for (std::size_t bad = 0; bad < 8; ++bad) {
            const CoderPtr coder = fourLetterCoder();
            support::addBatch(*coder, {u"c"}, {u"b"});
            const Bytes before = support::formOf(*coder, false);
            Batch batch;
            batch.files[bad] = {u"a", u"xyz"};
            EXPECT_EQ(refusalOf(*coder, batch, threads),
                      Refused::unknownCharacter);
            EXPECT_EQ(support::formOf(*coder, false), before);
            EXPECT_EQ(coder->pathCount, 1U);
            EXPECT_EQ(support::brokenInvariant(*coder), "");
            EXPECT_EQ(refusalOf(*coder, Batch(), threads), Refused::no);
            EXPECT_EQ(coder->pathCount, 17U);
            EXPECT_EQ(support::iterated(*coder).size(), 17U);
        }
    }
}

TEST(PathEncoding, ARefusedSingleFolderInsertsNothing) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> folders = {{u"a"}};
    std::vector<Texts> files = {{u"b", u""}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(folders, files),
                 tessel::NoCodeForEmptyString);
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_TRUE(coder->pathTree->root->isLeaf());
    EXPECT_TRUE(coder->partitionEnds.empty());
    coder->resetPathsToBTree();
    EXPECT_TRUE(coder->asyncFolders.empty());
    support::addBatch(*coder, {u"a"}, {u"b"});
    EXPECT_EQ(coder->pathCount, 1U);
}

TEST(PathEncoding, WhatARefusedBatchLeavesDoesNotDependOnTheThreads) {
    // Long components before and behind the failure.
    for (std::size_t tall = 0; tall < 8; ++tall) {
        Batch batch;
        batch.files[tall] = {std::u16string(2000, u'a')};
        batch.folders[4] = {u"x"};
        const CoderPtr first = fourLetterCoder();
        refusalOf(*first, batch, 1);
        EXPECT_EQ(first->maxCodeBytes, tall < 4 ? 502U : 2U);
        for (const unsigned threads : threadCounts) {
            const CoderPtr coder = fourLetterCoder();
            refusalOf(*coder, batch, threads);
            EXPECT_EQ(coder->maxCodeBytes, first->maxCodeBytes)
                << threads << " threads";
            EXPECT_EQ(support::formOf(*coder, false),
                      support::formOf(*first, false));
        }
    }
}

TEST(PathEncoding, TheFailingFoldersOwnComponentsUpToTheFailureCount) {
    for (std::size_t bad = 0; bad < 8; ++bad) {
        Batch batch;
        batch.files[bad] = {std::u16string(2000, u'a'), u"x",
                            std::u16string(4000, u'a')};
        for (const unsigned threads : threadCounts) {
            const CoderPtr coder = fourLetterCoder();
            refusalOf(*coder, batch, threads);
            EXPECT_EQ(coder->maxCodeBytes, 502U)
                << "folder " << bad << ", " << threads << " threads";
        }
    }
}

// Long folders at the front keep their worker busy, so that the others come
// to its range with many folders left, in steps of several folders.
Batch lopsidedBatch() {
    constexpr std::size_t folders = 700;
    Batch batch;
    batch.folders.assign(folders, Texts{u"a", u"b"});
    batch.files.assign(folders, Texts{u"c"});
    for (std::size_t i = 0; i < folders / 8; ++i)
        batch.files[i] = Texts(i < 3 ? 3000 : 60, u"abcdabcdabcdabcd");
    return batch;
}

TEST(PathEncoding, ALopsidedBatchIsInsertedInOrderOnAnyNumberOfThreads) {
    Batch batch = lopsidedBatch();
    for (std::size_t i = 0; i < batch.folders.size(); ++i)
        batch.folders[i] = {std::u16string(i % 29, u'b') + u"a"};
    const CoderPtr first = fourLetterCoder();
    refusalOf(*first, batch, 1);
    EXPECT_EQ(first->partitionEnds.size(), batch.folders.size());
    for (const unsigned threads : {2U, 3U, 7U}) {
        const CoderPtr coder = fourLetterCoder();
        EXPECT_EQ(refusalOf(*coder, batch, threads), Refused::no);
        EXPECT_EQ(support::formOf(*coder, false),
                  support::formOf(*first, false));
        EXPECT_EQ(coder->maxCodeBytes, first->maxCodeBytes);
    }
}

// The second worker meets a long name in its own folders, runs out of them
// and then meets the failure among the first worker's.
TEST(PathEncoding, ALongNameBehindTheFailureDoesNotCount) {
    Batch batch = lopsidedBatch();
    const std::size_t half = batch.folders.size() / 2;
    batch.files[batch.files.size() - 1] = {std::u16string(2000, u'a')};
    batch.files[half - 1] = {u"x"};
    for (int round = 0; round < 20; ++round) {
        const CoderPtr coder = fourLetterCoder();
        EXPECT_EQ(refusalOf(*coder, batch, 2), Refused::unknownCharacter);
        EXPECT_EQ(coder->maxCodeBytes, 6U);
    }
}

// The failure of the lowest folder, and the longest component up to it,
// whichever worker met it and whatever else failed.
RC_GTEST_PROP(PathEncoding, ALopsidedBatchIsRefusedAsInOrder, ()) {
    Batch batch = lopsidedBatch();
    const auto position = rc::gen::inRange<std::size_t>(0, 700);
    const auto bad = *rc::gen::nonEmpty(
        rc::gen::container<std::vector<std::size_t>>(position));
    for (std::size_t k = 0; k < bad.size(); ++k) {
        Texts& list = k % 3 == 0 ? batch.folders[bad[k]] : batch.files[bad[k]];
        list.push_back(k % 2 == 0 ? u"" : u"x");
    }
    const std::size_t tall = *position;
    batch.files[tall].insert(batch.files[tall].begin(),
                             std::u16string(900, u'a'));
    const CoderPtr first = fourLetterCoder();
    const Refused expected = refusalOf(*first, batch, 1);
    RC_ASSERT(expected != Refused::no);
    for (const unsigned threads : {2U, 3U, 7U}) {
        const CoderPtr coder = fourLetterCoder();
        RC_ASSERT(refusalOf(*coder, batch, threads) == expected);
        RC_ASSERT(coder->maxCodeBytes == first->maxCodeBytes);
        RC_ASSERT(coder->pathCount == 0U);
    }
    const std::size_t lowest = *std::min_element(bad.begin(), bad.end());
    if (tall < lowest) RC_ASSERT(first->maxCodeBytes > 200U);
    if (tall > lowest) RC_ASSERT(first->maxCodeBytes < 200U);
}

TEST(PathEncoding, EncodingAFolderLeavesItsTexts) {
    const CoderPtr coder = fourLetterCoder();
    coder->asyncFolders = {{u"a"}, {u"b"}};
    coder->asyncFiles = {{u"c"}, {u"d"}};
    coder->encodedFolders.resize(2);
    coder->encodedFiles.resize(2);
    coder->generateCodeForPath(0, 1);
    EXPECT_EQ(coder->asyncFolders, (std::vector<Texts>{{u"a"}, {u"b"}}));
    EXPECT_EQ(coder->asyncFiles, (std::vector<Texts>{{u"c"}, {u"d"}}));
    EXPECT_EQ(coder->encodedFolders.size(), 2U);
}

std::vector<tessel::PackedComponents> encodedFoldersOf(tessel::Batch& batch) {
    const tessel::MutexLock lock(batch.folderResultMutex);
    return batch.encodedFolders;
}

std::vector<tessel::PackedComponents> encodedFilesOf(tessel::Batch& batch) {
    const tessel::MutexLock lock(batch.fileResultMutex);
    return batch.encodedFiles;
}

TEST(PathEncoding, WorkersReleaseTheTextsThatTheyEncoded) {
    for (const unsigned threads : threadCounts) {
        const CoderPtr coder = fourLetterCoder();
        const Batch batch = lopsidedBatch();
        std::vector<Texts> folders = batch.folders;
        std::vector<Texts> files = batch.files;
        tessel::BatchEncoder encoder(coder->code(), coder->maxCodeBytes,
                                     folders, files);
        encoder.encode(threads);
        tessel::Batch& encoded = encoder.batch();
        EXPECT_EQ(encoded.folders, std::vector<Texts>(batch.folders.size()));
        EXPECT_EQ(encoded.files, std::vector<Texts>(batch.files.size()));
        EXPECT_EQ(coder->pathCount, 0U);
        coder->encodedFolders = encodedFoldersOf(encoded);
        coder->encodedFiles = encodedFilesOf(encoded);
        coder->addPathToBTreeFromAsyncData();
        const CoderPtr whole = fourLetterCoder();
        refusalOf(*whole, batch, threads);
        EXPECT_EQ(support::formOf(*coder, false),
                  support::formOf(*whole, false));
    }
}

TEST(PathEncoding, NothingToEncodeNeedsNoWorkers) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> folders;
    std::vector<Texts> files;
    tessel::BatchEncoder encoder(coder->code(), coder->maxCodeBytes, folders,
                                 files);
    encoder.encode(4);
    EXPECT_TRUE(encodedFoldersOf(encoder.batch()).empty());
    coder->addPathToBTreeFromAsyncData();
    EXPECT_EQ(coder->pathCount, 0U);
}

TEST(PathEncoding, ACoderWithoutACodeRefusesEveryBatch) {
    HuffmanPathTree coder;
    for (const unsigned threads : threadCounts)
        EXPECT_EQ(refusalOf(coder, Batch(), threads),
                  Refused::unknownCharacter);
    EXPECT_EQ(coder.pathCount, 0U);
}

// ---- Whole paths ----

TEST(PathEncoding, AWholePathAddedTwiceIsADuplicateTheSecondTime) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b"});
    support::addWhole(*coder, {u"a", u"b"});
    EXPECT_FALSE(coder->hasDuplicate(1));
    EXPECT_TRUE(coder->hasDuplicate(2));
    EXPECT_FALSE(coder->hasDuplicate(3));
    ASSERT_EQ(coder->duplicates.size(), 1U);
    EXPECT_EQ(coder->duplicates.at(2), (PathTrack{0, 0}));
    EXPECT_EQ(coder->pathCount, 2U);
    EXPECT_EQ(coder->maxDuplicateTrackLength, 2U);
    EXPECT_EQ(coder->maxDuplicatePathNumber, 2U);
    EXPECT_TRUE(coder->partitionEnds.empty());
}

TEST(PathEncoding, ANewWholePathIsCountedAndNoDuplicate) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b"});
    support::addWhole(*coder, {u"a", u"c"});
    EXPECT_TRUE(coder->duplicates.empty());
    EXPECT_EQ(coder->maxDuplicatePathNumber, 0U);
    EXPECT_EQ(coder->maxDuplicateTrackLength, 0U);
    EXPECT_EQ(coder->pathCount, 2U);
}

TEST(PathEncoding, TheLongestDuplicateTrackIsRemembered) {
    const CoderPtr coder = fourLetterCoder();
    support::addWhole(*coder, {u"a", u"b", u"c"});
    support::addWhole(*coder, {u"a", u"b", u"c"});
    support::addWhole(*coder, {u"a", u"b"});
    EXPECT_EQ(coder->duplicates.at(3), (PathTrack{0, 0}));
    EXPECT_EQ(coder->maxDuplicateTrackLength, 3U);
    EXPECT_EQ(coder->maxDuplicatePathNumber, 3U);
}

TEST(PathEncoding, AWholePathOfNoComponentsIsStillCounted) {
    const CoderPtr coder = fourLetterCoder();
    Components none;
    coder->addPathToBTree(none);
    EXPECT_EQ(coder->pathCount, 1U);
    EXPECT_TRUE(coder->duplicates.empty());
}

TEST(PathEncoding, APartitionOfRawComponentsIsMovedIn) {
    const CoderPtr coder = fourLetterCoder();
    Components folder = {{0x00, 2}};
    Components files = {{0x01, 2}, {0x02, 2}};
    coder->addPathToBTree(folder, files);
    EXPECT_EQ(folder, (Components{{}}));
    EXPECT_EQ(files, (Components{{}, {}}));
    EXPECT_EQ(coder->partitionEnds, (Ends{2}));
    EXPECT_EQ(coder->maxCodeBytes, 0U);
}

// ---- A file that becomes a folder ----

TEST(PathEncoding, AFileWhoseNameServesAsAFolderIsNoPathAnyMore) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b", u"c"});
    support::addBatch(*coder, {u"a", u"b"}, {u"d"});
    EXPECT_EQ(coder->pathCount, 3U);
    EXPECT_EQ(coder->partitionTracks[1], (PathTrack{0, 0, 0}));
    EXPECT_EQ(support::iterated(*coder),
              (std::vector<Texts>{{u"a", u"b", u"d"}, {u"a", u"c"}}));
}

TEST(PathEncoding, NumbersOfABatchWhoseFirstFileBecameAFolderPointElsewhere) {
    const CoderPtr coder = fourLetterCoder();
    support::addBatch(*coder, {u"a"}, {u"b"});
    support::addBatch(*coder, {u"a"}, {u"c", u"d"});
    support::addBatch(*coder, {u"a", u"c"}, {u"aa"});
    // The second batch's track now ends at the folder c.
    const auto answer = support::found(*coder, {2});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*coder, answer->folders[0]),
              (Texts{u"a", u"c"}));
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"aa"});
    // Where its second file was sought there is nothing.
    EXPECT_FALSE(support::found(*coder, {3}));
    // The third batch joined a stored folder and is found.
    const auto third = support::found(*coder, {4});
    ASSERT_TRUE(third);
    EXPECT_EQ(support::decodedBy(*coder, third->files[0]), Texts{u"aa"});
}

TEST(PathEncoding, APathThatIsAlsoAFolderSplitElsewhereStaysApart) {
    const CoderPtr coder = fourLetterCoder();
    // c/a is a file and a folder: the file is split one level higher.
    support::addBatches(*coder, {{u"b"}, {u"b", u"c", u"a"}, {u"b", u"c"}},
                        {{u"cda"}, {u"d"}, {u"b"}});
    EXPECT_EQ(
        support::iterated(*coder),
        (std::vector<Texts>{
            {u"b", u"cda"}, {u"b", u"c", u"a", u"d"}, {u"b", u"c", u"b"}}));
    const auto answer = support::found(*coder, {1, 2, 3});
    ASSERT_TRUE(answer);
    EXPECT_EQ(support::decodedBy(*coder, answer->files[0]), Texts{u"cda"});
}

// ---- Workers' remains ----

TEST(PathEncoding, ClearingWithoutWorkersDoesNothing) {
    const CoderPtr coder = fourLetterCoder();
    coder->joinAllGenThreads();
    coder->clearThreadResources();
    support::addBatch(*coder, {u"a"}, {u"b"});
    coder->joinAllGenThreads();
    coder->clearThreadResources();
    EXPECT_EQ(coder->pathCount, 1U);
}

TEST(PathEncoding, JoiningWaitsForTheThreadsAndForgetsThem) {
    const CoderPtr coder = fourLetterCoder();
    bool done = false;
    coder->genThreads.emplace_back([&done] { done = true; });
    coder->genThreads.emplace_back();  // not joinable
    coder->joinAllGenThreads();
    EXPECT_TRUE(done);
    EXPECT_TRUE(coder->genThreads.empty());
}

TEST(PathEncoding, TheDestructorJoinsWorkers) {
    bool done = false;
    {
        const CoderPtr coder = fourLetterCoder();
        coder->genThreads.emplace_back([&done] { done = true; });
    }
    EXPECT_TRUE(done);
}

}  // namespace
