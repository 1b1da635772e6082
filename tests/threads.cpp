// What happens on several threads: encoding, and the release of copies.

#include <gtest/gtest.h>

#include <thread>

#include "tests/support/Coders.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using support::Texts;
using tessel::HuffmanPathTree;

const std::u16string characters = u"/abcdefghijklmnopqrstuvwxyz0123456789.";

CoderPtr lettersCoder() {
    std::vector<double> frequencies;
    for (std::size_t i = 0; i < characters.size(); ++i)
        frequencies.push_back(static_cast<double>(i % 7 + 1));
    return support::coderWith(characters, frequencies);
}

std::u16string nameOf(std::size_t number) {
    std::u16string name = u"file";
    for (; number > 0; number /= 36) name += characters[1 + number % 36];
    return name;
}

struct Batch {
    std::vector<Texts> folders;
    std::vector<Texts> files;
};

// Folders that come again, with files of different number and length.
Batch batchOf(std::size_t folders, std::size_t seed) {
    Batch batch;
    for (std::size_t i = 0; i < folders; ++i) {
        batch.folders.push_back(
            {u"/", nameOf((i * 31 + seed) % 97), nameOf(i % 11)});
        Texts& names = batch.files.emplace_back();
        for (std::size_t k = 0; k < (i * seed) % 9; ++k)
            names.push_back(nameOf(i * k + seed));
        if (i % 50 == 0) names.push_back(std::u16string(500 + i, u'a'));
    }
    return batch;
}

TEST(Threads, BatchesAreTheSameOnAnyNumberOfWorkers) {
    Bytes first;
    for (const unsigned threads : {1U, 2U, 3U, 7U, 64U}) {
        const CoderPtr coder = lettersCoder();
        for (std::size_t round = 1; round < 6; ++round) {
            const Batch batch = batchOf(150 * round, round);
            support::addBatches(*coder, batch.folders, batch.files, threads);
        }
        const Bytes form = support::formOf(*coder, false);
        if (first.empty()) first = form;
        EXPECT_EQ(form, first) << threads << " threads";
        EXPECT_EQ(support::brokenInvariant(*coder), "");
    }
}

TEST(Threads, TheHardwaresNumberOfWorkersGivesTheSame) {
    const Batch batch = batchOf(500, 3);
    const CoderPtr single = lettersCoder();
    support::addBatches(*single, batch.folders, batch.files, 1);
    const CoderPtr coder = lettersCoder();
    std::vector<Texts> folders = batch.folders;
    std::vector<Texts> files = batch.files;
    coder->generateCodeAsyncAndAddPaths(folders, files);
    EXPECT_EQ(support::formOf(*coder, false), support::formOf(*single, false));
}

TEST(Threads, FailuresOnManyWorkersAtOnceLeaveTheCoderUsable) {
    const CoderPtr coder = lettersCoder();
    for (int round = 0; round < 5; ++round) {
        Batch batch = batchOf(64, 5);
        for (std::size_t i = 3; i < 64; i += 2) batch.files[i] = {u"?"};
        batch.files[3] = {u""};
        EXPECT_THROW(
            support::addBatches(*coder, batch.folders, batch.files, 64),
            tessel::NoCodeForEmptyString);
    }
    EXPECT_EQ(coder->pathCount, 0U);
    const Batch batch = batchOf(64, 5);
    support::addBatches(*coder, batch.folders, batch.files, 64);
    EXPECT_EQ(support::brokenInvariant(*coder), "");
}

TEST(Threads, ComponentsMayBeEncodedOnSeveralThreads) {
    const CoderPtr coder = lettersCoder();
    std::vector<std::thread> threads;
    for (std::size_t t = 0; t < 4; ++t) {
        threads.emplace_back([&coder, t] {
            for (std::size_t i = 0; i < 500; ++i) {
                const std::u16string text((i * 7 + t) % 300 + 1, u'x');
                EXPECT_EQ(coder->generatePathFrom(coder->generateCodeFor(text)),
                          text);
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(coder->maxCodeBytes,
              coder->generateCodeFor(std::u16string(300, u'x')).size());
}

// Each copy's last use and its release, all at the same time.
void releaseTogether(std::vector<CoderPtr> coders) {
    std::vector<std::thread> threads;
    for (CoderPtr& coder : coders)
        threads.emplace_back(
            [owned = std::move(coder)]() mutable { owned.reset(); });
    for (std::thread& thread : threads) thread.join();
}

TEST(Threads, CopiesAreReleasedOnDifferentThreads) {
    for (int round = 0; round < 5; ++round) {
        std::vector<CoderPtr> coders;
        coders.push_back(lettersCoder());
        const Batch batch = batchOf(300, 7);
        support::addBatches(*coders[0], batch.folders, batch.files);
        for (std::size_t i = 1; i < 6; ++i) {
            coders.push_back(std::make_unique<HuffmanPathTree>());
            coders[i]->copyTree(*coders[i / 2]);
            // Nodes from each copy's own pool, also below another's files.
            const Batch more = batchOf(20, i);
            support::addBatches(*coders[i], more.folders, more.files);
            support::addBatch(*coders[i],
                              {u"/", nameOf(7), nameOf(0), u"filea"},
                              {u"late", nameOf(i)});
        }
        const CoderPtr kept = std::move(coders[2]);
        const std::vector<Texts> paths = support::iterated(*kept);
        EXPECT_GT(paths.size(), 300U);
        coders.erase(coders.begin() + 2);
        releaseTogether(std::move(coders));
        // What the others shared with it, and what only they made and it
        // sees, is still there.
        EXPECT_EQ(support::iterated(*kept), paths);
        EXPECT_EQ(support::brokenInvariant(*kept), "");
        support::addBatch(*kept, {u"/", nameOf(7)}, {u"after"});
        EXPECT_EQ(support::iterated(*kept).size(), paths.size() + 1);
    }
}

TEST(Threads, PassesOfCopiesAreReleasedOnDifferentThreads) {
    const CoderPtr source = lettersCoder();
    const Batch batch = batchOf(200, 3);
    support::addBatches(*source, batch.folders, batch.files);
    const std::vector<Texts> paths = support::iterated(*source);
    source->resetPathsToBTree();
    std::vector<CoderPtr> copies;
    for (int i = 0; i < 4; ++i) {
        copies.push_back(std::make_unique<HuffmanPathTree>());
        copies.back()->copyTree(*source);
        tessel::Components path;
        for (int k = 0; k < 5 * i; ++k) source->getNextPathFromBTree(path);
    }
    releaseTogether(std::move(copies));
    EXPECT_EQ(support::iterated(*source), paths);
}

// Everything of a coder that only reads, on it and on its copies at once.
TEST(Threads, ACoderAndItsCopiesAreReadOnDifferentThreads) {
    const CoderPtr source = lettersCoder();
    const Batch batch = batchOf(300, 7);
    support::addBatches(*source, batch.folders, batch.files);
    std::vector<double> numbers;
    for (std::uint64_t i = 1; i <= source->pathCount; i += 3)
        numbers.push_back(static_cast<double>(i));
    const auto expected = support::found(*source, numbers);
    ASSERT_TRUE(expected);
    const std::vector<Texts> paths = support::iterated(*source);
    const Bytes form = support::formOf(*source, false);
    HuffmanPathTree copy;
    copy.copyTree(*source);
    std::vector<std::thread> threads;
    for (std::size_t t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            HuffmanPathTree& read = t % 2 == 0 ? *source : copy;
            for (int round = 0; round < 5; ++round) {
                const auto found = support::found(read, numbers);
                EXPECT_TRUE(found && found->files == expected->files &&
                            found->folders == expected->folders);
                EXPECT_EQ(support::formOf(read, false), form);
                EXPECT_GT(read.memoryUsage().total(), 0U);
            }
        });
    }
    // A pass changes the coder that it is made on, and no other.
    HuffmanPathTree walked;
    walked.copyTree(*source);
    EXPECT_EQ(support::iterated(walked), paths);
    for (std::thread& thread : threads) thread.join();
}

TEST(Threads, CodersThatShareNothingWorkAtTheSameTime) {
    Bytes forms[3];
    std::vector<std::thread> threads;
    for (Bytes& form : forms) {
        threads.emplace_back([&form] {
            const CoderPtr coder = lettersCoder();
            for (std::size_t round = 1; round < 4; ++round) {
                const Batch batch = batchOf(100, round);
                support::addBatches(*coder, batch.folders, batch.files, 3);
            }
            form = support::formOf(
                *support::restoredFrom(support::formOf(*coder, true), true,
                                       *coder),
                true);
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(forms[0], forms[1]);
    EXPECT_EQ(forms[0], forms[2]);
}

}  // namespace
