#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "archive/ArchiveExceptions.hpp"
#include "archive/FolderHeads.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::ChangedSegment;

// Folders "100/" to "399/" with a path each: heads are 100/, 228/ and 356/.
archives::Paths threeHeads() {
    archives::Paths list;
    for (int i = 100; i < 400; ++i) list.push_back(std::to_string(i) + "/x");
    return list;
}

TEST(FolderHeads, AreEvery128thFolder) {
    const archives::OpenArchive archive(threeHeads());
    const FolderHeads heads(archive.segment());
    ASSERT_EQ(heads.size(), 3U);
    for (std::uint32_t i = 0; i < 3; ++i) {
        EXPECT_EQ(heads.folder(i), std::to_string(100 + 128 * i) + '/');
        EXPECT_EQ(heads.number(i), 128 * i);
        EXPECT_EQ(heads.folderBlock(i), 16 * i);
        EXPECT_EQ(heads.nameBlock(i), 128 * i / 16);
    }
    EXPECT_EQ(heads.nameBlock(3), archive.segment().nameBlocks() - 1);
    EXPECT_TRUE(heads.fillsSection());
}

TEST(FolderHeads, OfAShortListAreItsFirstFolder) {
    const archives::OpenArchive archive({"a/b", "a/c"});
    const FolderHeads heads(archive.segment());
    ASSERT_EQ(heads.size(), 1U);
    EXPECT_EQ(heads.folder(0), "a/");
}

// Bytes 0 to 3 of an entry are the folder's offset in the text, 4 to 7 its
// block.
TEST(FolderHeads, OffsetsOutsideTheTextAreDamage) {
    const archives::Bytes archive = archives::archiveOf(threeHeads());
    for (const std::uint64_t offset : {10U, 11U}) {
        const ChangedSegment changed(
            archive, archives::flip(Section::FolderHeads, offset, 0x40));
        const Segment segment(changed.bytes(), changed.entry());
        const FolderHeads heads(segment);
        EXPECT_THROW(heads.folder(0), DamagedArchiveException);
        EXPECT_THROW(heads.folder(1), DamagedArchiveException);
        EXPECT_EQ(heads.folder(2), "356/");
    }
}

TEST(FolderHeads, BlocksAreBelowTheNumberOfBlocks) {
    const ChangedSegment changed(
        archives::archiveOf(threeHeads()),
        archives::flip(Section::FolderHeads, 8 + 6, 0xFF));
    const Segment segment(changed.bytes(), changed.entry());
    EXPECT_EQ(FolderHeads(segment).nameBlock(1), segment.nameBlocks() - 1);
}

TEST(FolderHeads, FillTheirSectionOrSaySo) {
    const archives::Bytes archive = archives::archiveOf(threeHeads());
    // The first offset, the last offset, the last block.
    for (const std::uint64_t offset : {0U, 3 * 8U, 3 * 8U + 4}) {
        const ChangedSegment changed(
            archive, archives::flip(Section::FolderHeads, offset, 1));
        const Segment segment(changed.bytes(), changed.entry());
        EXPECT_FALSE(FolderHeads(segment).fillsSection()) << offset;
    }
}

}  // namespace
}  // namespace tessel::archive
