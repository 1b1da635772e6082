// A batch on workers: how it is split, its order, and what a refused one
// leaves.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <stdexcept>
#include <string>

#include "coder/BatchEncoder.hpp"
#include "tests/support/Coders.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::fourLetterCoder;
using support::Texts;
using tessel::HuffmanPathTree;
using Range = std::pair<std::uint64_t, std::uint64_t>;

constexpr unsigned threadCounts[] = {0, 1, 2, 3, 7, 64};

// ---- How a batch is split ----

TEST(BatchEncoder, TenFoldersOnFourThreadsLeaveTheRemainderToTheLast) {
    EXPECT_EQ(HuffmanPathTree::splitFolders(10, 4),
              (std::vector<Range>{{0, 1}, {2, 3}, {4, 5}, {6, 9}}));
}

TEST(BatchEncoder, MoreThreadsThanFoldersGiveEachFolderAWorker) {
    EXPECT_TRUE(HuffmanPathTree::splitFolders(0, 4).empty());
    EXPECT_EQ(HuffmanPathTree::splitFolders(3, 8),
              (std::vector<Range>{{0, 0}, {1, 1}, {2, 2}}));
}

TEST(BatchEncoder, AsManyThreadsAsFoldersGiveEachFolderAWorker) {
    const std::vector<Range> ranges = HuffmanPathTree::splitFolders(8, 8);
    ASSERT_EQ(ranges.size(), 8U);
    for (std::uint64_t w = 0; w < 8; ++w) EXPECT_EQ(ranges[w], Range(w, w));
}

TEST(BatchEncoder, AnUnknownNumberOfThreadsCountsAsTwo) {
    EXPECT_EQ(HuffmanPathTree::splitFolders(5, 0),
              (std::vector<Range>{{0, 1}, {2, 4}}));
}

TEST(BatchEncoder, EverySplitCoversEachFolderOnce) {
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

TEST(BatchEncoder, ABatchTakesBothListsOver) {
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

TEST(BatchEncoder, InsertionIsInInputOrderOnAnyNumberOfThreads) {
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

TEST(BatchEncoder, OneWorkersBodyFillsItsRangeOnly) {
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
    // Before a pass, whose beginning would clear them, too.
    EXPECT_TRUE(coder->asyncFolders.empty());
    EXPECT_TRUE(coder->asyncFiles.empty());
    EXPECT_TRUE(coder->encodedFolders.empty());
    EXPECT_TRUE(coder->encodedFiles.empty());
    EXPECT_EQ(coder->memoryUsage().batch, 0U);
    EXPECT_EQ(
        support::iterated(*coder),
        (std::vector<Texts>{{u"a", u"a"}, {u"a", u"b"}, {u"b", u"c"}, {u"c"}}));
}

// ---- Refused batches ----

TEST(BatchEncoder, ABatchOfNoFoldersReturnsAtOnce) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> none;
    coder->generateCodeAsyncAndAddPaths(none, none);
    EXPECT_EQ(coder->pathCount, 0U);
    EXPECT_TRUE(coder->partitionEnds.empty());
    EXPECT_TRUE(coder->partitionTracks.empty());
}

TEST(BatchEncoder, ARefusedFoldersTextsCanBeMendedAndTriedAgain) {
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

TEST(BatchEncoder, OneListForFoldersAndFilesIsRefused) {
    const CoderPtr coder = fourLetterCoder();
    std::vector<Texts> both = {{u"a"}, {u"b"}};
    EXPECT_THROW(coder->generateCodeAsyncAndAddPaths(both, both),
                 std::invalid_argument);
    EXPECT_EQ(both, (std::vector<Texts>{{u"a"}, {u"b"}}));
}

TEST(BatchEncoder, ListsOfDifferentLengthAreRefusedAndNothingChanges) {
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

TEST(BatchEncoder, TheFailureOfTheFirstFailingFolderIsThrown) {
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

TEST(BatchEncoder, ARefusedBatchInsertsNothingAndTheCoderCanBeUsedOn) {
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

TEST(BatchEncoder, ARefusedSingleFolderInsertsNothing) {
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

TEST(BatchEncoder, WhatARefusedBatchLeavesDoesNotDependOnTheThreads) {
    // Long components before and after the failure.
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

TEST(BatchEncoder, TheFailingFoldersOwnComponentsUpToTheFailureCount) {
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

TEST(BatchEncoder, ALopsidedBatchIsInsertedInOrderOnAnyNumberOfThreads) {
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
TEST(BatchEncoder, ALongNameAfterTheFailureDoesNotCount) {
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
RC_GTEST_PROP(BatchEncoder, ALopsidedBatchIsRefusedAsInOrder, ()) {
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

TEST(BatchEncoder, EncodingAFolderLeavesItsTexts) {
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

std::vector<tessel::ComponentList> encodedFoldersOf(tessel::Batch& batch) {
    const tessel::MutexLock lock(batch.folderResultMutex);
    return batch.encodedFolders;
}

std::vector<tessel::ComponentList> encodedFilesOf(tessel::Batch& batch) {
    const tessel::MutexLock lock(batch.fileResultMutex);
    return batch.encodedFiles;
}

TEST(BatchEncoder, WorkersReleaseTheTextsThatTheyEncoded) {
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

TEST(BatchEncoder, NothingToEncodeNeedsNoWorkers) {
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

TEST(BatchEncoder, ACoderWithoutACodeRefusesEveryBatch) {
    HuffmanPathTree coder;
    for (const unsigned threads : threadCounts)
        EXPECT_EQ(refusalOf(coder, Batch(), threads),
                  Refused::unknownCharacter);
    EXPECT_EQ(coder.pathCount, 0U);
}

// ---- What a refused batch holds ----

TEST(BatchEncoder, WhatARefusedBatchHoldsIsNamedAndReleased) {
    const CoderPtr coder = fourLetterCoder();
    EXPECT_EQ(coder->memoryUsage().batch, 0U);
    Batch batch;
    batch.files[0] = {u"x"};
    batch.files[7] = Texts(100, std::u16string(500, u'a'));
    EXPECT_EQ(refusalOf(*coder, batch, 1), Refused::unknownCharacter);
    EXPECT_GT(coder->memoryUsage().batch, 100U * 1000);
    EXPECT_LT(coder->memoryUsage().batch, 120U * 1000);
    EXPECT_TRUE(coder->encodedFolders.empty());
    coder->resetPathsToBTree();
    EXPECT_EQ(coder->memoryUsage().batch, 0U);
    EXPECT_EQ(refusalOf(*coder, batch, 7), Refused::unknownCharacter);
    EXPECT_EQ(refusalOf(*coder, Batch(), 7), Refused::no);
    EXPECT_EQ(coder->memoryUsage().batch, 0U);
}

}  // namespace
