#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <random>
#include <span>
#include <string>

#include "archive/ArchiveExceptions.hpp"
#include "archive/Segment.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::archiveOf;
using archives::OpenArchive;

// Opens the only segment of an archive after `change` was made to its bytes.
template <class Change>
void openChanged(Change change) {
    archives::Bytes bytes = archiveOf(archives::sortedPaths(500));
    const SegmentEntry entry = archives::firstEntry(bytes);
    change(bytes, entry);
    const std::span<const std::uint8_t> whole(bytes);
    const Segment segment(whole.subspan(entry.offset, entry.bytes), entry);
    segment.tables();
}

TEST(Segment, BlocksFollowEachOther) {
    const OpenArchive archive(archives::sortedPaths(5000));
    const Segment& segment = archive.segment();
    std::uint32_t end = 0;
    std::uint32_t seen = 0;
    for (std::uint32_t b = 0; b < segment.nameBlocks(); ++b) {
        const Segment::NameBlock block = segment.nameBlock(b);
        EXPECT_EQ(block.begin, end);
        EXPECT_GE(block.seen, seen);
        EXPECT_EQ(block.seen, segment.seenBefore(b));
        end = block.end;
        seen = block.seen;
    }
    EXPECT_EQ(end, segment.bytesOf(Section::Names));
    end = 0;
    for (std::uint32_t b = 0; b < segment.folderBlocks(); ++b) {
        EXPECT_EQ(segment.folderBlock(b).begin, end);
        end = segment.folderBlock(b).end;
    }
    EXPECT_EQ(end, segment.bytesOf(Section::Folders));
}

TEST(Segment, FindsTheBlockThatNamesAFolder) {
    const OpenArchive archive(archives::sortedPaths(2000));
    const Segment& segment = archive.segment();
    const std::uint32_t last = segment.nameBlocks() - 1;
    ASSERT_GT(last, 2 * blocksPerGroup);
    std::uint32_t expected = 0;
    for (std::uint32_t folder = 0; folder < segment.head().folders; ++folder) {
        while (expected < last && segment.seenBefore(expected + 1) <= folder)
            ++expected;
        ASSERT_EQ(segment.blockNaming(folder, 0, last), expected);
        ASSERT_EQ(segment.blockNaming(folder, expected, last), expected);
        ASSERT_EQ(segment.blockNaming(folder, 0, expected), expected);
    }
}

TEST(Segment, NamesABlockOfTheRangeEvenIfNoneFits) {
    const OpenArchive archive(archives::sortedPaths(2000));
    const Segment& segment = archive.segment();
    const std::uint32_t folders = segment.head().folders;
    EXPECT_EQ(segment.blockNaming(0, 20, 40), 20U);
    EXPECT_EQ(segment.blockNaming(folders, 20, 40), 40U);
    EXPECT_EQ(segment.blockNaming(folders, 40, 20), 40U);
}

TEST(Segment, WideBlocksFollowEachOther) {
    archives::Paths paths = archives::sortedPaths(300);
    // Letters in no order, so that neither prefixes nor tokens shorten them.
    std::mt19937 random(1);
    for (std::size_t i = 0; i < 20; ++i) {
        std::string name(5000 + i * 37, ' ');
        for (char& letter : name)
            letter = static_cast<char>('a' + random() % 26);
        paths[i * 7] = name;
    }
    std::ranges::sort(paths);
    const OpenArchive archive(paths);
    const Segment& segment = archive.segment();
    ASSERT_GT(segment.bytesOf(Section::WideGroups), 0U);
    std::uint32_t end = 0;
    for (std::uint32_t b = 0; b < segment.nameBlocks(); ++b) {
        EXPECT_EQ(segment.nameBlock(b).begin, end);
        end = segment.nameBlock(b).end;
    }
    EXPECT_EQ(end, segment.bytesOf(Section::Names));
}

TEST(Segment, RefusesPlacesOutsideASection) {
    const OpenArchive archive(archives::sortedPaths(100));
    const Segment& segment = archive.segment();
    const std::uint64_t bytes = segment.bytesOf(Section::Names);
    EXPECT_NO_THROW(segment.require(Section::Names, 0, bytes));
    EXPECT_NO_THROW(segment.require(Section::Names, bytes, 0));
    EXPECT_THROW(segment.require(Section::Names, 0, bytes + 1),
                 DamagedArchiveException);
    EXPECT_THROW(segment.require(Section::Names, bytes + 1, 0),
                 DamagedArchiveException);
    EXPECT_THROW(segment.require(Section::Names, 1, ~std::uint64_t{0}),
                 DamagedArchiveException);
}

// What a segment says that was changed and has the right checksums.
template <class Use>
std::string saidOf(const archives::ChangedSegment& changed, Use use) {
    const Segment segment(changed.bytes(), changed.entry());
    try {
        use(segment);
    } catch (const DamagedArchiveException& damage) {
        return damage.cause();
    }
    return "";
}

TEST(Segment, RefusesTablesAndGroupsThatBreakTheRules) {
    const archives::Paths paths = archives::sortedPaths(500);
    const auto useTables = [](const Segment& segment) { segment.tables(); };
    const auto useGroup = [](const Segment& segment) { segment.nameBlock(1); };
    const archives::ChangedSegment table(
        paths, archives::flip(Section::TokenCodes, 0, 0xFF));
    EXPECT_EQ(saidOf(table, useTables), "A table of codes breaks the rules.");
    EXPECT_EQ(saidOf(table, useGroup), "");
    // The highest byte of the folders before the group.
    const archives::ChangedSegment group(
        paths, archives::flip(Section::NameGroups, 7, 0x80));
    EXPECT_EQ(saidOf(group, useTables), "");
    EXPECT_EQ(saidOf(group, useGroup),
              "A group has seen more folders than there are.");
}

TEST(Segment, RefusesADamagedHeadChecksumOrTable) {
    EXPECT_NO_THROW(openChanged([](auto&, auto&) {}));
    EXPECT_THROW(openChanged([](auto& bytes, auto& entry) {
                     bytes[entry.offset + 20] ^= 1;
                 }),
                 DamagedArchiveException);
    EXPECT_THROW(openChanged([](auto& bytes, auto& entry) {
                     bytes[entry.offset + segmentHeadBytes] ^= 1;
                 }),
                 DamagedArchiveException);
    EXPECT_THROW(openChanged([](auto& bytes, auto& entry) {
                     const auto head = SegmentHead::unpack(
                         std::span(bytes).subspan(entry.offset));
                     bytes[entry.offset + entry.bytes - head.bodyBytes()] ^= 1;
                 }),
                 DamagedArchiveException);
}

}  // namespace
}  // namespace tessel::archive
