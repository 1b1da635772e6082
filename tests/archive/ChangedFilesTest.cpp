// Archives whose files change while they are open.

#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <functional>
#include <random>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "archive/PathArchive.hpp"
#include "tests/archive/ArchiveLists.hpp"

namespace tessel {
namespace {

namespace fs = std::filesystem;
using archives::archiveOf;
using archives::Bytes;
using archives::Paths;

// A file that removes itself.
class File {
public:
    explicit File(const Bytes& bytes) { write(bytes); }
    ~File() { fs::remove(name()); }
    File(const File&) = delete;
    File& operator=(const File&) = delete;

    std::string name() const {
        return testing::TempDir() + "changed-" + std::to_string(::getpid());
    }
    // Writes it anew, over what is there.
    void write(const Bytes& bytes) const {
        std::ofstream(name(), std::ios::binary)
            .write(reinterpret_cast<const char*>(bytes.data()),
                   static_cast<std::streamsize>(bytes.size()));
    }
    void replace(const Bytes& bytes) const {
        fs::remove(name());
        write(bytes);
    }
};

// Reads in one way; false if something is wrong with what was read.
using Read = std::function<bool(const PathArchive&, const Paths&)>;

bool readsEach(const PathArchive& archive, const Paths& list) {
    std::string path;
    for (std::uint64_t i = 0; i < list.size(); i += 7) {
        archive.read(i, path);
        if (path != list[i]) return false;
    }
    return true;
}

bool readsInOrder(const PathArchive& archive, const Paths& list) {
    bool isRight = true;
    archive.forEach([&](std::uint64_t i, std::string_view path) {
        return isRight = path == list[i];
    });
    return isRight;
}

bool iterates(const PathArchive& archive, const Paths& list) {
    std::size_t i = 0;
    for (const std::string_view path : archive)
        if (path != list[i++]) return false;
    return i == list.size();
}

bool readsNumbers(const PathArchive& archive, const Paths& list) {
    std::vector<std::uint64_t> numbers;
    for (std::uint64_t i = 0; i < list.size(); i += 3)
        numbers.push_back(list.size() - 1 - i);
    bool isRight = true;
    archive.read(numbers, [&](std::uint64_t i, std::string_view path) {
        return isRight = path == list[i];
    });
    return isRight;
}

bool findsNumbers(const PathArchive& archive, const Paths& list) {
    for (std::size_t i = 0; i < list.size(); i += 101) {
        const auto number = archive.numberOf(list[i]);
        if (!number || list[*number] != list[i]) return false;
        if (!archive.contains(list[i])) return false;
    }
    return true;
}

bool findsTexts(const PathArchive& archive, const Paths& list) {
    bool isRight = true;
    const std::vector<std::string_view> texts = {"a", "e"};
    FindOptions options;
    options.threads = 2;
    archive.findEach(
        texts,
        [&](std::uint64_t i, std::string_view path) {
            return isRight = path == list[i];
        },
        options);
    for (const std::uint64_t i : archive.find({"lib"}, options))
        isRight &= list[i].find("lib") != std::string::npos;
    const auto all = archive.find(
        [&](std::string_view path) { return !path.empty(); }, options);
    return isRight && all.size() == list.size();
}

bool findsFolders(const PathArchive& archive, const Paths& list) {
    std::uint64_t found = 0;
    for (const NumberRange range : archive.folder("usr"))
        for (std::uint64_t i = range.begin; i < range.end; ++i, ++found)
            if (!list[i].starts_with("usr/")) return false;
    return found > 0;
}

const std::vector<Read> reads = {readsEach,    readsInOrder, iterates,
                                 readsNumbers, findsNumbers, findsTexts,
                                 findsFolders};

// Whether reading ends with the exception for damage, after nothing wrong.
bool endsByDamage(const PathArchive& archive, const Paths& list,
                  const Read& read, std::atomic<int>& began) {
    try {
        for (bool isFirst = true;; isFirst = false) {
            if (!read(archive, list)) return false;
            if (isFirst) ++began;
        }
    } catch (const DamagedArchiveException&) {
        return true;
    }
}

std::vector<Paths> lists() {
    const Paths sorted = archives::sortedPaths(5000);
    return {sorted, archives::shuffled(sorted)};
}

// ---- Cut and overwritten ----

TEST(ChangedFiles, EveryReadTellsThatTheFileWasCut) {
    for (const Paths& list : lists()) {
        const Bytes bytes = archiveOf(list, archives::segmentsOf(2000));
        for (const Read& read : reads)
            for (const std::size_t size :
                 {std::size_t{0}, bytes.size() / 3, bytes.size() - 1}) {
                const File file(bytes);
                const auto archive = PathArchive::open(file.name());
                EXPECT_TRUE(read(archive, list));
                fs::resize_file(file.name(), size);
                EXPECT_THROW(read(archive, list), DamagedArchiveException);
            }
    }
}

TEST(ChangedFiles, ThreadsThatReadEndTheSameWay) {
    constexpr int threadsPerCut = 4;
#ifdef QZTESSEL_SLOWED
    constexpr int cuts = 3;
#else
    constexpr int cuts = 12;
#endif
    std::mt19937 random(47);
    for (const Paths& list : lists()) {
        const Bytes bytes = archiveOf(list, archives::segmentsOf(2000));
        for (int cut = 0; cut < cuts; ++cut) {
            const File file(bytes);
            const auto archive = PathArchive::open(file.name());
            std::atomic<int> began = 0;
            std::atomic<int> ended = 0;
            std::vector<std::jthread> threads;
            for (int t = 0; t < threadsPerCut; ++t)
                threads.emplace_back([&, read = reads[random() % 7]] {
                    ended += endsByDamage(archive, list, read, began) ? 1 : 0;
                });
            while (began < threadsPerCut) std::this_thread::yield();
            if (cut % 3 == 0)
                file.write(Bytes(random() % (2 * bytes.size()), 0xAB));
            else
                fs::resize_file(file.name(), random() % bytes.size());
            threads.clear();
            EXPECT_EQ(ended, threadsPerCut) << cut;
        }
    }
}

TEST(ChangedFiles, CareTellsThatTheFileWasCut) {
    const Bytes bytes = archiveOf(archives::sortedPaths(5000));
    const File file(bytes);
    const auto archive = PathArchive::open(file.name());
    archive.verify();
    fs::resize_file(file.name(), bytes.size() - 1);
    EXPECT_THROW(archive.verify(), DamagedArchiveException);
    EXPECT_THROW(static_cast<void>(archive.findDamage()),
                 DamagedArchiveException);
    fs::resize_file(file.name(), 5000);
    EXPECT_THROW(archive.verify(), DamagedArchiveException);
    EXPECT_FALSE(archive.findDamage().empty());
}

TEST(ChangedFiles, SalvageEndsWhereTheFileIsCut) {
    const Paths list = archives::sortedPaths(50'000);
    const Bytes bytes = archiveOf(list, archives::segmentsOf(10'000));
    for (const std::size_t size : {std::size_t{0}, bytes.size() - 1}) {
        const File file(bytes);
        std::size_t shown = 0;
        EXPECT_THROW(PathArchive::salvage(
                         file.name(),
                         [&](std::uint64_t number, std::string_view path) {
                             EXPECT_EQ(path, list[number]);
                             if (++shown == 100)
                                 fs::resize_file(file.name(), size);
                         }),
                     DamagedArchiveException);
        EXPECT_EQ(shown, 100U);
    }
}

// ---- Replaced ----

TEST(ChangedFiles, AReplacedFileGoesOnBeingRead) {
    const Paths list = archives::sortedPaths(5000);
    const File file(archiveOf(list));
    const auto archive = PathArchive::open(file.name());
    file.replace(archiveOf(Paths{"another"}));
    for (const Read& read : reads) EXPECT_TRUE(read(archive, list));
    archive.verify();
    EXPECT_EQ(PathArchive::open(file.name())[0], "another");
}

TEST(ChangedFiles, ThreadsReadWhileTheFileIsAppendedTo) {
    constexpr int readers = 8;
    constexpr std::size_t step = 50;
    const Paths list = archives::sortedPaths(1000);
    const File file(archiveOf(Paths(list.begin(), list.begin() + step)));
    std::atomic<bool> isDone = false;
    std::atomic<int> failures = 0;
    std::vector<std::jthread> threads;
    for (int t = 0; t < readers; ++t)
        threads.emplace_back([&] {
            std::uint64_t last = 0;
            while (!isDone) {
                const auto archive = PathArchive::open(file.name());
                const Paths part(
                    list.begin(),
                    list.begin() + static_cast<std::ptrdiff_t>(archive.size()));
                if (archive.size() % step != 0 || archive.size() < last ||
                    !readsInOrder(archive, part))
                    ++failures;
                last = archive.size();
            }
        });
    for (std::size_t first = step; first < list.size(); first += step) {
        auto writer = ArchiveWriter::append(file.name());
        for (std::size_t i = first; i < first + step; ++i) writer.add(list[i]);
        writer.finish();
    }
    isDone = true;
    threads.clear();
    EXPECT_EQ(failures, 0);
    EXPECT_TRUE(iterates(PathArchive::open(file.name()), list));
}

}  // namespace
}  // namespace tessel
