// What a damaged archive answers: an exception or the right path, never a
// wrong one.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <span>
#include <stdexcept>
#include <string>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "archive/SumTree.hpp"
#include "tests/archive/ArchiveLists.hpp"

namespace {

using support::Paths;
using tessel::DamagedArchiveException;
using tessel::PathArchive;

struct Sample {
    Paths paths;
    std::vector<std::uint8_t> bytes;
};

// Three small archives: sorted, shuffled with an index, and two segments as
// given.
std::vector<Sample> samples() {
    std::vector<Sample> result(3);
    result[0].paths = support::fileList(60, 1);
    result[0].bytes = support::archiveOf(result[0].paths);
    std::mt19937 random(5);
    result[1].paths = support::fileList(60, 2);
    std::shuffle(result[1].paths.begin(), result[1].paths.end(), random);
    tessel::ArchiveOptions options;
    options.index = tessel::ArchiveIndex::WhereNeeded;
    result[1].bytes = support::archiveOf(result[1].paths, options);
    result[2].paths = {"b/2", "b/1", "a", "b/3", "c/", "/"};
    options.pathsPerSegment = 3;
    result[2].bytes = support::archiveOf(result[2].paths, options);
    return result;
}

// Names of these lists take at least a byte each, so a piece of 4 KiB holds no
// more of them, and one more block at each end.
constexpr std::size_t maxLostNames = 4096 + 2 * 16;

// Every answer is right or a DamagedArchiveException. Returns whether one was
// such an exception.
bool answersRightOrThrows(const std::vector<std::uint8_t>& bytes,
                          const Paths& paths) {
    bool threw = false;
    const auto attempt = [&](auto answer) {
        try {
            answer();
        } catch (const DamagedArchiveException&) {
            threw = true;
        } catch (const tessel::UnsupportedArchiveVersionException&) {
            ADD_FAILURE() << "damage passes for a newer version";
        }
    };
    attempt([&] {
        const PathArchive archive = PathArchive::over(bytes);
        EXPECT_EQ(archive.size(), paths.size());
        attempt([&] { EXPECT_EQ(support::pathsOf(archive), paths); });
        for (std::size_t i = 0; i < paths.size(); i += 13) {
            attempt([&] { EXPECT_EQ(archive[i], paths[i]); });
            attempt([&] {
                const auto first =
                    std::find(paths.begin(), paths.end(), paths[i]);
                EXPECT_EQ(archive.numberOf(paths[i]), first - paths.begin());
            });
        }
        attempt([&] { archive.verify(); });
    });
    return threw;
}

// What salvage finds is right, and what it misses it reports as lost.
void expectHonestSalvage(const std::vector<std::uint8_t>& bytes,
                         const Paths& paths) {
    std::vector<bool> found(paths.size());
    tessel::SalvageReport report;
    try {
        report = PathArchive::salvage(
            bytes, [&](std::uint64_t number, std::string_view path) {
                ASSERT_LT(number, paths.size());
                EXPECT_EQ(path, paths[number]);
                EXPECT_FALSE(found[number]);
                found[number] = true;
            });
    } catch (const DamagedArchiveException&) {
        return;  // it could not be told from no archive at all
    }
    EXPECT_EQ(report.kept, std::count(found.begin(), found.end(), true));
    if (!report.complete) return;
    std::vector<bool> lost(paths.size());
    for (const auto& range : report.lost)
        for (std::uint64_t n = range.begin; n < range.end; ++n) {
            ASSERT_LT(n, paths.size());
            lost[n] = true;
        }
    for (std::size_t i = 0; i < paths.size(); ++i)
        EXPECT_NE(found[i], lost[i]) << i;
}

}  // namespace

TEST(ArchiveDamage, EveryFlippedBitIsFound) {
    for (const Sample& sample : samples()) {
        std::vector<std::uint8_t> bytes = sample.bytes;
        for (std::size_t bit = 0; bit < 8 * bytes.size(); ++bit) {
            const auto mask = static_cast<std::uint8_t>(1U << (bit % 8));
            bytes[bit / 8] ^= mask;
            ASSERT_TRUE(answersRightOrThrows(bytes, sample.paths))
                << "bit " << bit;
            bytes[bit / 8] ^= mask;
        }
        EXPECT_FALSE(answersRightOrThrows(bytes, sample.paths));
    }
}

TEST(ArchiveDamage, EveryCutAndEveryExtensionIsFoundAtOpening) {
    for (const Sample& sample : samples()) {
        for (std::size_t size = 0; size < sample.bytes.size(); ++size) {
            const std::vector<std::uint8_t> cut(
                sample.bytes.begin(),
                sample.bytes.begin() + static_cast<std::ptrdiff_t>(size));
            ASSERT_THROW(PathArchive::over(cut), DamagedArchiveException)
                << size;
        }
        std::vector<std::uint8_t> longer = sample.bytes;
        for (int i = 0; i < 70; ++i) {
            longer.push_back(static_cast<std::uint8_t>(i % 2));
            ASSERT_THROW(PathArchive::over(longer), DamagedArchiveException);
        }
    }
}

TEST(ArchiveDamage, SalvageOfAFlippedByteKeepsOnlyRightPaths) {
    for (const Sample& sample : samples()) {
        std::vector<std::uint8_t> bytes = sample.bytes;
        for (std::size_t at = 0; at < bytes.size(); ++at) {
            SCOPED_TRACE(at);
            bytes[at] ^= 0x55;
            expectHonestSalvage(bytes, sample.paths);
            bytes[at] ^= 0x55;
        }
    }
}

TEST(ArchiveDamage, SalvageOfACutFileKeepsOnlyRightPaths) {
    for (const Sample& sample : samples()) {
        for (std::size_t size = 0; size < sample.bytes.size(); size += 3) {
            SCOPED_TRACE(size);
            const std::vector<std::uint8_t> cut(
                sample.bytes.begin(),
                sample.bytes.begin() + static_cast<std::ptrdiff_t>(size));
            expectHonestSalvage(cut, sample.paths);
        }
    }
}

TEST(ArchiveDamage, SalvageOfASoundArchiveKeepsEverything) {
    for (const Sample& sample : samples()) {
        Paths found;
        const auto report = PathArchive::salvage(
            sample.bytes, [&](std::uint64_t, std::string_view path) {
                found.emplace_back(path);
            });
        EXPECT_EQ(found, sample.paths);
        EXPECT_TRUE(report.lost.empty());
        EXPECT_TRUE(report.damages.empty());
        EXPECT_TRUE(report.complete);
    }
}

TEST(ArchiveDamage, ADamagedPieceCostsFewPathsOfALargeArchive) {
    const Paths paths = support::fileList(100'000, 9);
    const std::vector<std::uint8_t> whole = support::archiveOf(paths);
    std::mt19937 random(1);
    for (int round = 0; round < 12; ++round) {
        SCOPED_TRACE(round);
        std::vector<std::uint8_t> bytes = whole;
        // Names fill the middle of the file.
        const std::size_t at = bytes.size() / 4 + random() % (bytes.size() / 2);
        bytes[at] ^= 1;
        const auto report = PathArchive::salvage(
            bytes, [&](std::uint64_t number, std::string_view path) {
                ASSERT_EQ(path, paths[number]);
            });
        EXPECT_LT(report.kept, paths.size());
        EXPECT_GE(report.kept, paths.size() - maxLostNames);
        EXPECT_EQ(report.damages.size(), 1U);
    }
}

TEST(ArchiveDamage, ANewerVersionIsRefusedByName) {
    std::vector<std::uint8_t> bytes = support::archiveOf({"a"});
    bytes[8] = 2;
    EXPECT_THROW(PathArchive::over(bytes), DamagedArchiveException);
    constexpr std::size_t sumOffset = 56;
    const std::uint64_t sum =
        tessel::archive::sumOf(std::span(bytes).first(sumOffset), 0);
    for (std::size_t i = 0; i < 8; ++i)
        bytes[sumOffset + i] = static_cast<std::uint8_t>(sum >> (8 * i));
    try {
        PathArchive::over(bytes);
        FAIL() << "a newer version is read";
    } catch (const tessel::UnsupportedArchiveVersionException& newer) {
        EXPECT_EQ(newer.version(), 2U);
    }
}
