// What happens when the platform gives no more threads.

#include <gtest/gtest.h>

#include <system_error>

#include "coder/BatchEncoder.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/FewThreads.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::FewThreads;
using support::Texts;
using tessel::HuffmanPathTree;

std::vector<Texts> folders() { return std::vector<Texts>(8, Texts{u"a"}); }
std::vector<Texts> files() { return std::vector<Texts>(8, Texts{u"b", u"c"}); }

TEST(ThreadCreation, ABatchWithoutThreadsIsRefusedAndTheCoderCanBeUsedOn) {
    for (int possible = 0; possible < 4; ++possible) {
        const CoderPtr coder = support::fourLetterCoder();
        support::addBatch(*coder, {u"d"}, {u"d"});
        const Bytes before = support::formOf(*coder, false);
        {
            const FewThreads few(possible);
            EXPECT_THROW(support::addBatches(*coder, folders(), files(), 4),
                         std::system_error);
        }
        EXPECT_EQ(support::formOf(*coder, false), before);
        EXPECT_EQ(coder->pathCount, 1U);
        EXPECT_EQ(support::brokenInvariant(*coder), "");
        support::addBatches(*coder, folders(), files(), 4);
        EXPECT_EQ(coder->pathCount, 17U);
        EXPECT_EQ(support::iterated(*coder).size(), 17U);
    }
}

TEST(ThreadCreation, TheErrorIsThePlatforms) {
    const CoderPtr coder = support::fourLetterCoder();
    const FewThreads few(1);
    try {
        support::addBatches(*coder, folders(), files(), 4);
        FAIL() << "a thread was started";
    } catch (const std::system_error& failure) {
        EXPECT_EQ(failure.code().value(), EAGAIN);
    }
}

// The workers that are there take over the folders of those that are not.
TEST(ThreadCreation, AWorkerThatIsDoneHelpsWithTheOtherFolders) {
    for (const int possible : {1, 2, 3}) {
        const CoderPtr coder = support::fourLetterCoder();
        auto folderTexts = folders();
        auto fileTexts = files();
        tessel::BatchEncoder encoder(coder->code(), coder->maxCodeBytes,
                                     folderTexts, fileTexts);
        {
            const FewThreads few(possible);
            EXPECT_THROW(encoder.encode(4), std::system_error);
        }
        tessel::Batch& batch = encoder.batch();
        EXPECT_EQ(batch.folders, std::vector<Texts>(8));
        EXPECT_EQ(batch.files, std::vector<Texts>(8));
        {
            const tessel::MutexLock lock(batch.folderResultMutex);
            coder->encodedFolders = batch.encodedFolders;
        }
        {
            const tessel::MutexLock lock(batch.fileResultMutex);
            coder->encodedFiles = batch.encodedFiles;
        }
        coder->addPathToBTreeFromAsyncData();
        const CoderPtr expected = support::fourLetterCoder();
        support::addBatches(*expected, folders(), files(), 1);
        EXPECT_EQ(support::formOf(*coder, false),
                  support::formOf(*expected, false));
    }
}

TEST(ThreadCreation, OneFolderNeedsNoThread) {
    const CoderPtr coder = support::fourLetterCoder();
    const FewThreads none(0);
    support::addBatch(*coder, {u"a"}, {u"b"});
    EXPECT_EQ(coder->pathCount, 1U);
}

TEST(ThreadCreation, AFailureBeforeTheMissingThreadsFoldersComesFirst) {
    const CoderPtr coder = support::fourLetterCoder();
    auto bad = files();
    bad[1] = {u"x"};  // of the first worker's folders
    const FewThreads few(2);
    EXPECT_THROW(support::addBatches(*coder, folders(), bad, 4),
                 tessel::CodeNotFoundException);
    EXPECT_EQ(coder->pathCount, 0U);
}

TEST(ThreadCreation, AFailureAfterTheMissingThreadsFoldersComesSecond) {
    const CoderPtr coder = support::fourLetterCoder();
    auto bad = files();
    bad[7] = {u"x"};  // of the last worker's folders
    const FewThreads few(2);
    EXPECT_THROW(support::addBatches(*coder, folders(), bad, 4),
                 std::system_error);
    EXPECT_EQ(coder->pathCount, 0U);
}

TEST(ThreadCreation, AsManyThreadsAsWorkersAreStarted) {
    struct Case {
        std::size_t folders;
        unsigned hardware;
        int threads;
    };
    for (const Case& sample : {Case{8, 3, 3}, Case{8, 64, 8}, Case{2, 7, 2},
                               Case{8, 0, 2}, Case{8, 1, 1}}) {
        const CoderPtr coder = support::fourLetterCoder();
        std::vector<Texts> some(sample.folders, Texts{u"a"});
        std::vector<Texts> names(sample.folders, Texts{u"b"});
        {
            const FewThreads exact(sample.threads);
            EXPECT_NO_THROW(
                support::addBatches(*coder, some, names, sample.hardware));
        }
        if (sample.threads == 1) continue;  // could be the calling one
        const FewThreads tooFew(sample.threads - 1);
        EXPECT_THROW(support::addBatches(*coder, some, names, sample.hardware),
                     std::system_error);
    }
}

}  // namespace
