// Archives on several threads: readers beside a writer, workers that fail, and
// threads that cannot be started.

#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/OrderedScan.hpp"
#include "archive/PathArchive.hpp"
#include "archive/Workers.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/support/FewThreads.hpp"

namespace {

using archives::Bytes;
using archives::Paths;
using support::FewThreads;
using tessel::ArchiveOptions;
using tessel::ArchiveWriter;
using tessel::PathArchive;

ArchiveOptions onThreads(unsigned threads) {
    ArchiveOptions options;
    options.threads = threads;
    options.index = tessel::ArchiveIndex::WhereNeeded;
    return options;
}

// Whether the archive answers with these paths, from a start of its own.
bool answers(const PathArchive& archive, const Paths& paths,
             std::uint64_t start) {
    bool right = archive.size() == paths.size();
    for (std::uint64_t i = 0; i < 20; ++i) {
        const std::uint64_t number = (start + i * 97) % paths.size();
        right &= archive[number] == paths[number];
        const auto found = archive.numberOf(paths[number]);
        right &= found && paths[*found] == paths[number];
    }
    archive.forEach(start, start + 100,
                    [&](auto number, std::string_view path) {
                        right &= path == paths[number];
                    });
    tessel::FindOptions options;
    options.threads = 2;
    right &=
        archive.find([](auto) { return true; }, options).size() == paths.size();
    return right;
}

TEST(ArchiveThreads, EightThreadsReadWhileTheFileIsAppendedTo) {
    const std::string file =
        testing::TempDir() + "appended-" + std::to_string(::getpid());
    Paths paths = archives::scatteredPaths(1500);
    {
        ArchiveWriter writer(file, onThreads(1));
        writer.addAll(paths);
        writer.finish();
    }
    // What is derived when it is first needed is first needed by all of them.
    const PathArchive archive = PathArchive::open(file);
    std::atomic<bool> isAppended = false;
    std::atomic<int> wrong = 0;
    std::vector<std::thread> readers;
    for (std::uint64_t reader = 0; reader < 8; ++reader)
        readers.emplace_back([&, reader, copy = archive] {
            do {
                if (!answers(reader % 2 == 0 ? archive : copy, paths,
                             reader * 100))
                    ++wrong;
            } while (!isAppended);
        });
    constexpr std::uint64_t appends = 5;
    for (std::uint64_t i = 0; i < appends; ++i) {
        auto writer = ArchiveWriter::append(file, onThreads(2));
        writer.add("added/" + std::to_string(i));
        writer.finish();
    }
    isAppended = true;
    for (std::thread& reader : readers) reader.join();
    EXPECT_EQ(wrong, 0);
    const PathArchive after = PathArchive::open(file);
    EXPECT_EQ(after.size(), paths.size() + appends);
    EXPECT_EQ(after[paths.size() + 4], "added/4");
    std::remove(file.c_str());
}

// Enough paths for three workers.
TEST(ArchiveThreads, AnArchiveIsTheSameIfThreadsCannotBeStarted) {
    const Paths paths = archives::scatteredPaths(20'000);
    const Bytes expected = archives::archiveOf(paths, onThreads(1));
    for (const int possible : {0, 1}) {
        const FewThreads few(possible);
        Bytes out;
        ArchiveWriter writer(out, onThreads(4));
        writer.addAll(paths);
        writer.finish();
        EXPECT_EQ(out, expected) << possible;
        const PathArchive archive = PathArchive::over(out);
        tessel::FindOptions options;
        options.threads = 4;
        EXPECT_EQ(archive.find("file", options).size(), paths.size());
        archive.verify(options);
    }
}

TEST(ArchiveThreads, WorkersThatCannotBeStartedAreDoneWithout) {
    for (const int possible : {0, 1, 2, 3}) {
        const FewThreads few(possible);
        tessel::archive::Workers workers(4, {});
        EXPECT_EQ(workers.count(), static_cast<unsigned>(possible) + 1);
        std::vector<std::atomic<int>> runs(100);
        workers.run(runs.size(), [&](std::size_t i, unsigned) { ++runs[i]; });
        for (const auto& count : runs) EXPECT_EQ(count, 1);
    }
}

// All workers fail at the same time, and one of the failures comes through.
TEST(ArchiveThreads, WorkersThatAllFailEndTheWork) {
    for (int round = 0; round < 20; ++round) {
        tessel::archive::Workers workers(4, {});
        EXPECT_THROW(workers.run(1000,
                                 [](std::size_t i, unsigned) {
                                     if (i % 2 == 0)
                                         throw std::runtime_error("worker");
                                 }),
                     std::runtime_error);
        std::atomic<int> runs = 0;
        workers.run(10, [&](std::size_t, unsigned) { ++runs; });
        EXPECT_EQ(runs, 10);
    }
}

TEST(ArchiveThreads, APredicateThatFailsOnAllThreadsEndsTheSearch) {
    const Paths paths = archives::sortedPaths(2'000);
    const PathArchive archive =
        PathArchive::own(archives::archiveOf(paths, archives::segmentsOf(200)));
    tessel::FindOptions options;
    options.threads = 4;
    for (int round = 0; round < 5; ++round) {
        EXPECT_THROW(archive.find(
                         [](std::string_view path) -> bool {
                             if (path.ends_with("txt"))
                                 throw std::runtime_error("predicate");
                             return true;
                         },
                         options),
                     std::runtime_error);
    }
    EXPECT_EQ(archive.find([](auto) { return true; }, options).size(),
              paths.size());
}

}  // namespace
