// What archives and their writers are when memory runs out, at every
// allocation in turn.

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/OrderedScan.hpp"
#include "archive/PathArchive.hpp"
#include "archive/Workers.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/support/EachAllocation.hpp"

namespace {

using archives::Bytes;
using archives::Paths;
using support::atEachAllocation;
using tessel::ArchiveOptions;
using tessel::ArchiveWriter;
using tessel::PathArchive;

// Every allocation of any thread counts.
constexpr support::AllocationCount onAllThreads = {
    .threads = support::FailingThreads::All};

// The same where an operation makes thousands: each of the first hundred, then
// one of so many.
constexpr support::AllocationCount sparsely = {
    .threads = support::FailingThreads::All,
    .allUpTo = 100,
    .step = 97,
    .most = 100'000};

ArchiveOptions indexed(unsigned threads, std::uint64_t pathsPerSegment) {
    ArchiveOptions options;
    options.threads = threads;
    options.index = tessel::ArchiveIndex::WhereNeeded;
    options.pathsPerSegment = pathsPerSegment;
    return options;
}

// Sorted, in no order, and in folders of no order: three ways to be stored.
std::vector<Paths> listsOfEachOrder() {
    return {archives::sortedPaths(90), archives::scatteredPaths(90),
            archives::inFolderRuns(90)};
}

Paths pathsOf(const PathArchive& archive) {
    Paths paths;
    for (const std::string_view path : archive) paths.emplace_back(path);
    return paths;
}

// ---- Writing ----

TEST(ArchiveMemory, AListIsPackedOrTheVectorIsAsItWas) {
    for (const Paths& paths : listsOfEachOrder()) {
        const Bytes expected = archives::archiveOf(paths, indexed(1, 40));
        const Bytes before = {1, 2, 3};
        Bytes out;
        atEachAllocation([&] { out = before; },
                         [&] {
                             ArchiveWriter writer(out, indexed(1, 40));
                             writer.addAll(paths);
                             writer.finish();
                         },
                         [&](bool succeeded) {
                             EXPECT_EQ(out, succeeded ? expected : before);
                         },
                         sparsely);
    }
}

// Enough paths for threads of the writer's own.
TEST(ArchiveMemory, AListIsPackedOnWorkersOrTheVectorIsAsItWas) {
    const Paths paths = archives::scatteredPaths(20'000);
    const Bytes expected = archives::archiveOf(paths, indexed(1, 100'000));
    support::AllocationCount count = sparsely;
    count.allUpTo = 20;
    count.step = 997;
    Bytes out;
    atEachAllocation(
        [&] { out.clear(); },
        [&] {
            ArchiveWriter writer(out, indexed(3, 100'000));
            writer.addAll(paths);
            writer.finish();
        },
        [&](bool succeeded) { EXPECT_EQ(out, succeeded ? expected : Bytes()); },
        count);
}

TEST(ArchiveMemory, PathsAreAppendedOrTheArchiveIsAsItWas) {
    const Paths old = archives::sortedPaths(60);
    const Paths more = archives::scatteredPaths(60);
    Paths all = old;
    all.insert(all.end(), more.begin(), more.end());
    const Bytes before = archives::archiveOf(old, indexed(1, 40));
    Bytes archive;
    atEachAllocation(
        [&] { archive = before; },
        [&] {
            auto writer = ArchiveWriter::append(archive, indexed(1, 40));
            writer.addAll(more);
            writer.finish();
        },
        [&](bool succeeded) {
            if (succeeded)
                EXPECT_EQ(pathsOf(PathArchive::over(archive)), all);
            else
                EXPECT_EQ(archive, before);
        },
        sparsely);
}

TEST(ArchiveMemory, AnArchiveIsRepackedOrAsItWas) {
    const Paths paths = archives::sortedPaths(90);
    const Bytes before = archives::archiveOf(paths, indexed(1, 40));
    Bytes archive;
    atEachAllocation(
        [&] { archive = before; },
        [&] { ArchiveWriter::repack(archive, indexed(1, 90)); },
        [&](bool succeeded) {
            EXPECT_EQ(archive, succeeded
                                   ? archives::archiveOf(paths, indexed(1, 90))
                                   : before);
        },
        sparsely);
}

class ArchiveFileMemory : public testing::Test {
protected:
    ArchiveFileMemory() { std::filesystem::create_directory(folder_); }
    ~ArchiveFileMemory() override { std::filesystem::remove_all(folder_); }

    void put(const Bytes& bytes) const {
        std::ofstream(file_, std::ios::binary)
            .write(reinterpret_cast<const char*>(bytes.data()),
                   static_cast<std::streamsize>(bytes.size()));
    }
    Bytes held() const {
        std::ifstream in(file_, std::ios::binary);
        return {std::istreambuf_iterator<char>(in), {}};
    }
    std::ptrdiff_t filesInFolder() const {
        return std::distance(std::filesystem::directory_iterator(folder_), {});
    }

    // The file must hold `packed` if the operation succeeds, otherwise what it
    // held before. Nothing else is left.
    template <class Operate>
    void expectPackedOrAsItWas(const Bytes& packed, Operate operate) {
        const Bytes before =
            archives::archiveOf(archives::sortedPaths(60), indexed(1, 40));
        atEachAllocation([&] { put(before); }, operate,
                         [&](bool succeeded) {
                             EXPECT_EQ(held(), succeeded ? packed : before);
                             EXPECT_EQ(filesInFolder(), 1);
                         },
                         sparsely);
    }

    std::filesystem::path folder_ =
        std::filesystem::path(testing::TempDir()) /
        ("archive-memory-" + std::to_string(::getpid()));
    std::string file_ = folder_ / "a.tessel";
};

TEST_F(ArchiveFileMemory, AFileIsReplacedOrAsItWas) {
    const Paths paths = archives::scatteredPaths(60);
    expectPackedOrAsItWas(archives::archiveOf(paths, indexed(1, 40)), [&] {
        ArchiveWriter writer(file_, indexed(1, 40));
        writer.addAll(paths);
        writer.finish();
    });
}

TEST_F(ArchiveFileMemory, AFileIsAppendedToOrAsItWas) {
    const Paths more = archives::scatteredPaths(60);
    Bytes appended =
        archives::archiveOf(archives::sortedPaths(60), indexed(1, 40));
    auto writer = ArchiveWriter::append(appended, indexed(1, 40));
    writer.addAll(more);
    writer.finish();
    expectPackedOrAsItWas(appended, [&] {
        auto onFile = ArchiveWriter::append(file_, indexed(1, 40));
        onFile.addAll(more);
        onFile.finish();
    });
}

TEST_F(ArchiveFileMemory, AFileIsRepackedOrAsItWas) {
    const auto full = indexed(1, 100);
    expectPackedOrAsItWas(archives::archiveOf(archives::sortedPaths(60), full),
                          [&] { ArchiveWriter::repack(file_, full); });
}

TEST_F(ArchiveFileMemory, AFileIsOpenedAndSalvagedOrNot) {
    const Paths paths = archives::sortedPaths(60);
    put(archives::archiveOf(paths, indexed(1, 40)));
    const auto openAndRead = [&] {
        EXPECT_EQ(PathArchive::open(file_).size(), paths.size());
    };
    atEachAllocation([] {}, openAndRead, [](bool) {}, onAllThreads);
    std::uint64_t shown = 0;
    atEachAllocation(
        [&] { shown = 0; },
        [&] { PathArchive::salvage(file_, [&](auto, auto) { ++shown; }); },
        [&](bool succeeded) {
            if (succeeded) {
                EXPECT_EQ(shown, paths.size());
            }
        },
        onAllThreads);
}

// A path for which memory was lacking can be added again; the archive is the
// same as if nothing had happened.
TEST(ArchiveMemory, APathIsAddedOrTheWriterIsAsItWas) {
    for (const Paths& paths : listsOfEachOrder()) {
        const auto options = indexed(1, 1000);
        Bytes out;
        ArchiveWriter writer(out, options);
        std::uint64_t added = 0;
        for (const std::string& path : paths) {
            bool isThere = false;
            for (std::size_t n = 0; !isThere; ++n) {
                const support::AllocationFailure failure(n);
                try {
                    writer.add(path);
                    isThere = true;
                } catch (const std::bad_alloc&) {
                }
                if (isThere) ++added;
                EXPECT_EQ(writer.size(), added);
            }
        }
        writer.finish();
        EXPECT_EQ(out, archives::archiveOf(paths, options));
    }
}

// ---- Reading ----

// Calls read(archive) on an archive that was just opened, so that all that is
// made when it is first needed is made there. Whatever failed, the archive
// answers afterwards.
template <class Read>
void expectReadable(const Bytes& bytes, const Paths& paths, Read read) {
    std::optional<PathArchive> archive;
    atEachAllocation([&] { archive = PathArchive::over(bytes); },
                     [&] { read(*archive); },
                     [&](bool) {
                         read(*archive);
                         EXPECT_EQ((*archive)[paths.size() - 1], paths.back());
                     },
                     onAllThreads);
}

template <class Read>
void expectReadableInEachOrder(Read read) {
    for (const Paths& paths : listsOfEachOrder()) {
        for (const std::uint64_t perSegment : {40U, 1000U}) {
            const auto options = indexed(1, perSegment);
            expectReadable(archives::archiveOf(paths, options), paths,
                           [&](const auto& archive) { read(archive, paths); });
        }
    }
}

TEST(ArchiveMemory, OpeningSucceedsOrThrows) {
    const Bytes bytes =
        archives::archiveOf(archives::sortedPaths(90), indexed(1, 20));
    atEachAllocation([] {},
                     [&] { EXPECT_EQ(PathArchive::over(bytes).size(), 90U); },
                     [](bool) {}, onAllThreads);
    atEachAllocation([] {},
                     [&] { EXPECT_EQ(PathArchive::own(bytes).size(), 90U); },
                     [](bool) {}, onAllThreads);
}

TEST(ArchiveMemory, PathsAreReadByNumber) {
    expectReadableInEachOrder([](const auto& archive, const Paths& paths) {
        for (const std::size_t number : {0U, 89U, 41U})
            EXPECT_EQ(archive[number], paths[number]);
        const std::vector<std::uint64_t> numbers = {80, 3, 3, 41};
        std::size_t shown = 0;
        archive.read(numbers, [&](std::uint64_t number, std::string_view path) {
            EXPECT_EQ(number, numbers[shown++]);
            EXPECT_EQ(path, paths[number]);
        });
        EXPECT_EQ(shown, numbers.size());
    });
}

TEST(ArchiveMemory, PathsAreReadOneAfterTheOther) {
    expectReadableInEachOrder([](const auto& archive, const Paths& paths) {
        std::uint64_t next = 0;
        archive.forEach([&](std::uint64_t number, std::string_view path) {
            EXPECT_EQ(number, next++);
            EXPECT_EQ(path, paths[number]);
        });
        EXPECT_EQ(next, paths.size());
        EXPECT_TRUE(std::ranges::equal(archive, paths));
    });
}

// One that has thrown is at the end, as after damage.
TEST(ArchiveMemory, AnIteratorThatHasThrownIsAtTheEnd) {
    const Paths paths = archives::scatteredPaths(90);
    const PathArchive archive =
        PathArchive::own(archives::archiveOf(paths, indexed(1, 40)));
    std::optional<PathArchive::Iterator> at;
    atEachAllocation([&] { at.emplace(archive.begin()); },
                     [&] {
                         while (*at != archive.end()) ++*at;
                     },
                     [&](bool) {
                         EXPECT_EQ(*at, archive.end());
                         ++*at;
                         EXPECT_LE(at->number(), paths.size());
                     },
                     onAllThreads);
}

TEST(ArchiveMemory, NumbersAreFoundByPath) {
    expectReadableInEachOrder([](const auto& archive, const Paths& paths) {
        const auto number = archive.numberOf(paths[57]);
        ASSERT_TRUE(number);
        EXPECT_EQ(paths[*number], paths[57]);
        EXPECT_TRUE(archive.contains(paths[3]));
        EXPECT_FALSE(archive.contains("usr/lib9/none"));
        const std::string folder = paths[10].substr(0, paths[10].rfind('/'));
        EXPECT_FALSE(archive.folder(folder).empty());
    });
}

TEST(ArchiveMemory, SearchesFindEverythingOrThrow) {
    expectReadableInEachOrder([](const auto& archive, const Paths& paths) {
        for (const unsigned threads : {1U, 3U}) {
            tessel::FindOptions options;
            options.threads = threads;
            EXPECT_EQ(archive.find({"/"}, options).size(),
                      static_cast<std::size_t>(
                          std::ranges::count_if(paths, [](const auto& path) {
                              return path.find('/') != std::string::npos;
                          })));
            EXPECT_EQ(archive.find([](auto) { return true; }, options).size(),
                      paths.size());
            std::uint64_t next = 0;
            archive.findEach([](auto) { return true; },
                             [&](std::uint64_t number, std::string_view path) {
                                 EXPECT_EQ(number, next++);
                                 EXPECT_EQ(path, paths[number]);
                             },
                             options);
            EXPECT_EQ(next, paths.size());
        }
    });
}

TEST(ArchiveMemory, AnArchiveIsVerifiedAndNeverCalledDamaged) {
    expectReadableInEachOrder([](const auto& archive, const Paths& paths) {
        for (const unsigned threads : {1U, 3U}) {
            tessel::ScanOptions options;
            options.threads = threads;
            archive.verify(options);
            EXPECT_TRUE(archive.findDamage(options).empty());
        }
        EXPECT_EQ(archive.info().paths, paths.size());
    });
}

TEST(ArchiveMemory, SalvageShowsEverythingOrThrows) {
    for (const Paths& paths : listsOfEachOrder()) {
        Bytes bytes = archives::archiveOf(paths, indexed(1, 40));
        bytes.resize(bytes.size() - 40);  // the directory is gone
        std::uint64_t shown = 0;
        atEachAllocation(
            [&] { shown = 0; },
            [&] {
                const auto report = PathArchive::salvage(
                    bytes, [&](std::uint64_t number, std::string_view path) {
                        EXPECT_EQ(path, paths[number]);
                        ++shown;
                    });
                EXPECT_TRUE(report.lost.empty());
                EXPECT_FALSE(report.damages.empty());
            },
            [&](bool succeeded) {
                if (succeeded) {
                    EXPECT_EQ(shown, paths.size());
                }
            },
            onAllThreads);
    }
}

// ---- Workers ----

TEST(ArchiveMemory, WorkersRunEveryStepOnceOrThrow) {
    std::vector<std::atomic<int>> runs(100);
    atEachAllocation(
        [&] {
            for (auto& count : runs) count = 0;
        },
        [&] {
            tessel::archive::Workers workers(4, {});
            workers.run(runs.size(), [&](std::size_t i, unsigned) {
                const std::vector<int> work(10);
                ++runs[i];
            });
        },
        [&](bool succeeded) {
            for (const auto& count : runs)
                EXPECT_TRUE(succeeded ? count == 1 : count <= 1);
        },
        onAllThreads);
}

TEST(ArchiveMemory, AScanConsumesEverythingInOrderOrThrows) {
    std::uint64_t next = 0;
    atEachAllocation(
        [&] { next = 0; },
        [&] {
            tessel::ScanOptions options;
            options.threads = 4;
            tessel::archive::OrderedScan scan(100, options);
            scan.run([](std::uint64_t) { const std::vector<int> work(10); },
                     [&](std::uint64_t chunk) { return chunk == next++; });
        },
        [&](bool succeeded) {
            if (succeeded) {
                EXPECT_EQ(next, 100U);
            }
        },
        onAllThreads);
}

}  // namespace
