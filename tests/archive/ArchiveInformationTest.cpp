#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "archive/ArchiveInformation.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

std::uint64_t bytesOf(const ArchiveInfo& info, const std::string& section) {
    for (const auto& known : info.sections)
        if (known.name == section) return known.bytes;
    ADD_FAILURE() << section;
    return 0;
}

std::uint64_t bytesOfAll(const ArchiveInfo& info) {
    std::uint64_t bytes = 0;
    for (const auto& section : info.sections) bytes += section.bytes;
    return bytes;
}

TEST(ArchiveInformation, CountsPathsFoldersAndText) {
    const archives::OpenArchive archive({"a/b", "a/name", "folder/x", "z"});
    const ArchiveInfo info = infoOf(archive.reader());
    EXPECT_EQ(info.formatVersion, formatVersion);
    EXPECT_EQ(info.paths, 4U);
    EXPECT_EQ(info.folders, 3U);
    EXPECT_EQ(info.segments, 1U);
    EXPECT_EQ(info.sortedSegments, 1U);
    EXPECT_EQ(info.textBytes, 18U);
    EXPECT_EQ(info.longestName, 4U);
    EXPECT_EQ(info.longestFolder, 7U);
    EXPECT_EQ(info.fileBytes, archive.reader().bytes());
}

TEST(ArchiveInformation, SectionsAddUpToTheFile) {
    const archives::Paths list = archives::shuffled(archives::sortedPaths(60));
    const archives::OpenArchive archive(list, archives::segmentsOf(25));
    const ArchiveInfo info = infoOf(archive.reader());
    EXPECT_EQ(info.segments, 3U);
    EXPECT_EQ(info.sortedSegments, 0U);
    EXPECT_EQ(bytesOfAll(info), info.fileBytes);
    std::uint64_t names = 0;
    std::uint64_t folders = 0;
    for (std::size_t i = 0; i < 3; ++i) {
        names += archive.reader().segment(i).bytesOf(Section::Names);
        folders += archive.reader().segment(i).head().folders;
    }
    EXPECT_EQ(bytesOf(info, "names"), names);
    EXPECT_EQ(info.folders, folders);
    EXPECT_GE(bytesOf(info, "headers and padding"), 64U + 3 * (256U + 40U));
}

TEST(ArchiveInformation, OfAnEmptyArchiveIsItsHeader) {
    const archives::OpenArchive archive(archives::Paths{});
    const ArchiveInfo info = infoOf(archive.reader());
    EXPECT_EQ(info.paths, 0U);
    EXPECT_EQ(bytesOf(info, "headers and padding"), info.fileBytes);
    EXPECT_EQ(bytesOfAll(info), info.fileBytes);
}

TEST(ArchiveInformation, SumIsThatOfTheContents) {
    const auto sumOfList = [](const archives::Paths& list,
                              std::uint64_t perSegment) {
        const archives::OpenArchive archive(list,
                                            archives::segmentsOf(perSegment));
        return infoOf(archive.reader()).sum;
    };
    const auto sum = sumOfList({"a/b", "a/c", "d"}, 2);
    EXPECT_EQ(sumOfList({"a/b", "a/c", "d"}, 2), sum);
    EXPECT_NE(sumOfList({"a/b", "a/c", "e"}, 2), sum);
    EXPECT_NE(sumOfList({"a/b", "a/d", "d"}, 2), sum);
    EXPECT_NE(sumOfList({"d", "a/b", "a/c"}, 2), sum);
    EXPECT_NE(sumOfList({"a/b", "a/c", "d"}, 3), sum);
}

}  // namespace
}  // namespace tessel::archive
