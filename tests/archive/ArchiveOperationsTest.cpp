// Whole archives: what each reading operation answers, beside a plain vector
// of the same paths.
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "tests/archive/ArchiveLists.hpp"
#include "tests/archive/PlainAnswers.hpp"
#include "tests/support/Sizes.hpp"

namespace {

using support::expectAllAnswers;
using support::Paths;
using support::shareOf;
using tessel::ArchiveIndex;
using tessel::ArchiveLevel;
using tessel::ArchiveOptions;
using tessel::PathArchive;

}  // namespace

TEST(ArchiveOperations, AnswerAsAPlainVectorDoesOnEveryNastyList) {
    for (const auto& [name, paths] : support::nastyLists()) {
        SCOPED_TRACE(name);
        expectAllAnswers(support::archiveOf(paths), paths);
    }
}

TEST(ArchiveOperations, AnswerTheSameInSmallSegments) {
    for (const auto& [name, paths] : support::nastyLists()) {
        SCOPED_TRACE(name);
        ArchiveOptions options;
        options.pathsPerSegment = shareOf(700);
        options.index = ArchiveIndex::WhereNeeded;
        expectAllAnswers(support::archiveOf(paths, options), paths);
    }
}

TEST(ArchiveOperations, AnswerTheSameOnEveryLevel) {
    for (const ArchiveLevel level : {ArchiveLevel::Fast, ArchiveLevel::Best}) {
        for (const auto& [name, paths] : support::nastyLists()) {
            SCOPED_TRACE(name);
            ArchiveOptions options;
            options.level = level;
            const auto bytes = support::archiveOf(paths, options);
            ASSERT_EQ(support::pathsOf(PathArchive::over(bytes)), paths);
        }
    }
}

TEST(ArchiveOperations, AnswerAsAPlainVectorDoesOnRandomLists) {
    std::mt19937 random(20260101);
    for (std::size_t round = 0; round < shareOf(60); ++round) {
        SCOPED_TRACE(round);
        const Paths paths = support::randomList(random, 400);
        ArchiveOptions options;
        options.pathsPerSegment = round % 3 == 0 ? 37 : 8'000'000;
        options.index =
            round % 2 == 0 ? ArchiveIndex::None : ArchiveIndex::WhereNeeded;
        expectAllAnswers(support::archiveOf(paths, options), paths);
    }
}

TEST(ArchiveOperations, BytesDoNotDependOnThreads) {
    const Paths paths = support::fileList(shareOf(60'000), 5);
    ArchiveOptions options;
    options.pathsPerSegment = shareOf(25'000);
    options.threads = 1;
    const auto expected = support::archiveOf(paths, options);
    for (const unsigned threads : {2U, 3U, 7U, 0U}) {
        options.threads = threads;
        EXPECT_EQ(support::archiveOf(paths, options), expected);
    }
}

TEST(ArchiveOperations, AppendingInSlicesGivesTheSamePaths) {
    std::mt19937 random(3);
    for (std::size_t round = 0; round < shareOf(20); ++round) {
        SCOPED_TRACE(round);
        Paths paths;
        std::vector<std::uint8_t> bytes = support::archiveOf({});
        for (int slice = 0; slice < 4; ++slice) {
            const Paths more = support::randomList(random, 100);
            const std::vector<std::uint8_t> before = bytes;
            auto writer = tessel::ArchiveWriter::append(bytes);
            EXPECT_EQ(writer.size(), paths.size());
            writer.addAll(more);
            writer.finish();
            paths.insert(paths.end(), more.begin(), more.end());
            ASSERT_EQ(support::pathsOf(PathArchive::over(bytes)), paths);
        }
        expectAllAnswers(bytes, paths);
        tessel::ArchiveWriter::repack(bytes);
        ASSERT_EQ(bytes, support::archiveOf(paths));
    }
}

TEST(ArchiveOperations, MappedArchivesAnswerAsThoseInMemory) {
    const std::string file = testing::TempDir() + "archive-operations.tessel";
    const Paths paths = support::fileList(20'000, 6);
    {
        tessel::ArchiveWriter writer(file);
        writer.addAll(paths);
        writer.finish();
    }
    const PathArchive mapped = PathArchive::open(file);
    EXPECT_EQ(support::pathsOf(mapped), paths);
    const PathArchive owned = PathArchive::own(support::archiveOf(paths));
    EXPECT_EQ(support::pathsOf(owned), paths);
    EXPECT_EQ(owned.info().fileBytes, mapped.info().fileBytes);
    EXPECT_TRUE(std::ranges::equal(owned.bytes(), mapped.bytes()));
    for (const PathArchive& archive : {mapped, owned}) {
        archive.releasePages();
        EXPECT_EQ(support::pathsOf(archive), paths);
    }
}

TEST(ArchiveOperations, InfoAddsUp) {
    for (const auto& [name, paths] : support::nastyLists()) {
        SCOPED_TRACE(name);
        const auto bytes = support::archiveOf(paths);
        const auto info = PathArchive::over(bytes).info();
        EXPECT_EQ(info.paths, paths.size());
        EXPECT_EQ(info.fileBytes, bytes.size());
        std::uint64_t sections = 0;
        for (const auto& section : info.sections) sections += section.bytes;
        EXPECT_EQ(sections, bytes.size());
        std::uint64_t text = 0;
        for (const std::string& path : paths) text += path.size();
        EXPECT_EQ(info.textBytes, text);
    }
}
