#include <gtest/gtest.h>

#include "archive/Format.hpp"
#include "archive/SumTree.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

FileHeader someHeader() {
    FileHeader header;
    header.fileBytes = 1000 + 2 * segmentEntryBytes;
    header.paths = 7;
    header.segments = 2;
    header.directoryOffset = 1000;
    return header;
}

SegmentHead someHead() {
    SegmentHead head;
    head.order = ListOrder::Rearranged;
    head.folders = 3;
    head.paths = 5;
    head.textBytes = 77;
    head.maxNameBytes = 12;
    head.maxFolderBytes = 13;
    head.sectionBytes = {9, 33, 1, 0, 24, 5, 100, 40, 20, 0, 7000, 60, 2, 2};
    head.topSum = 0x0123456789ABCDEF;
    return head;
}

template <class Form>
Bytes packed(const Form& form) {
    Bytes bytes;
    form.pack(bytes);
    return bytes;
}

// Changes a byte and makes the final checksum right again.
Bytes mended(Bytes bytes, std::size_t at, std::uint8_t value) {
    bytes[at] = value;
    bytes.resize(bytes.size() - 8);
    packUint64(sumOf(bytes, 0), bytes);
    return bytes;
}

TEST(FormatTest, FileHeaderComesBack) {
    const Bytes bytes = packed(someHeader());
    ASSERT_EQ(bytes.size(), fileHeaderBytes);
    const FileHeader header = FileHeader::unpack(bytes);
    EXPECT_EQ(header.version, formatVersion);
    EXPECT_EQ(header.fileBytes, 1080U);
    EXPECT_EQ(header.paths, 7U);
    EXPECT_EQ(header.segments, 2U);
    EXPECT_EQ(header.directoryOffset, 1000U);
}

TEST(FormatTest, EveryFlippedBitOfAFileHeaderIsSeen) {
    const Bytes bytes = packed(someHeader());
    for (std::size_t bit = 0; bit < 8 * bytes.size(); ++bit) {
        Bytes flipped = bytes;
        flipped[bit / 8] ^= static_cast<std::uint8_t>(1U << bit % 8);
        EXPECT_THROW(FileHeader::unpack(flipped), DamagedFormException) << bit;
    }
}

TEST(FormatTest, ANewerHeaderTellsItsVersionOnly) {
    const Bytes bytes = mended(packed(someHeader()), 8, 9);
    EXPECT_EQ(FileHeader::unpack(bytes).version, 9U);
    EXPECT_THROW(FileHeader::unpack(mended(bytes, 8, 0)), DamagedFormException);
}

TEST(FormatTest, AHeaderThatContradictsItselfIsDamaged) {
    FileHeader header = someHeader();
    header.fileBytes += 1;
    EXPECT_THROW(FileHeader::unpack(packed(header)), DamagedFormException);
    header = someHeader();
    header.segments = 3;
    EXPECT_THROW(FileHeader::unpack(packed(header)), DamagedFormException);
    header = someHeader();
    header.directoryOffset = header.fileBytes + segmentEntryBytes;
    EXPECT_THROW(FileHeader::unpack(packed(header)), DamagedFormException);
}

TEST(FormatTest, ACutHeaderIsDamaged) {
    const Bytes bytes = packed(someHeader());
    for (std::size_t size = 0; size < bytes.size(); ++size)
        EXPECT_THROW(FileHeader::unpack(std::span(bytes).first(size)),
                     DamagedFormException);
}

TEST(FormatTest, ASegmentEntryBelongsToItsPlace) {
    const SegmentEntry entry{64, 4096, 12, 34};
    Bytes bytes;
    entry.pack(bytes, 5);
    ASSERT_EQ(bytes.size(), segmentEntryBytes);
    const SegmentEntry back = SegmentEntry::unpack(bytes, 5);
    EXPECT_EQ(back.offset, 64U);
    EXPECT_EQ(back.bytes, 4096U);
    EXPECT_EQ(back.firstNumber, 12U);
    EXPECT_EQ(back.paths, 34U);
    EXPECT_THROW(SegmentEntry::unpack(bytes, 4), DamagedFormException);
}

TEST(FormatTest, SegmentHeadComesBack) {
    const SegmentHead head = someHead();
    const Bytes bytes = packed(head);
    ASSERT_EQ(bytes.size(), segmentHeadBytes);
    const SegmentHead back = SegmentHead::unpack(bytes);
    EXPECT_EQ(back.order, head.order);
    EXPECT_EQ(back.folders, head.folders);
    EXPECT_EQ(back.paths, head.paths);
    EXPECT_EQ(back.textBytes, head.textBytes);
    EXPECT_EQ(back.maxNameBytes, head.maxNameBytes);
    EXPECT_EQ(back.maxFolderBytes, head.maxFolderBytes);
    EXPECT_EQ(back.sectionBytes, head.sectionBytes);
    EXPECT_EQ(back.topSum, head.topSum);
}

TEST(FormatTest, SectionsAreAlignedAndEndWithAGuard) {
    const SegmentHead head = someHead();
    EXPECT_EQ(head.offsetOf(Section::TokenCodes), 0U);
    EXPECT_EQ(head.offsetOf(Section::FirstTokenCodes), 16U);
    EXPECT_EQ(head.offsetOf(Section::ReplacedCodes), 56U);
    EXPECT_EQ(head.bodyBytes(),
              head.offsetOf(Section::Index) + 8 + bodyGuardBytes);
}

TEST(FormatTest, ImpossibleHeadsAreDamaged) {
    const Bytes bytes = packed(someHead());
    struct Change {
        std::size_t at;
        std::uint8_t value;
    };
    for (const Change change : {
             Change{0, 'X'},  // the tag
             Change{4, 3},    // no such order
             Change{5, 0},    // no names in a block
             Change{6, 0},    // no folders in a block
             Change{7, 0},    // no blocks per head
             Change{8, 8},    // pieces too small
             Change{8, 13},   // pieces too large
             Change{9, 1},    // not zero
             Change{12, 0},   // no folders
             Change{12, 6},   // more folders than paths
             Change{16, 0},   // no paths
             Change{23, 1},   // far too many paths
             Change{35, 1},   // a name of 16 MiB
             Change{39, 1},   // a folder of 16 MiB
             Change{40, 0},   // another size than the sections have
             Change{55, 1},   // a section beyond all bounds
             Change{160, 1},  // a section that does not exist
             Change{180, 1},  // not zero
         })
        EXPECT_THROW(
            SegmentHead::unpack(mended(bytes, change.at, change.value)),
            DamagedFormException)
            << change.at;
}

TEST(FormatTest, NumbersTakeAsManyBitsAsTheLargest) {
    SegmentHead head;
    for (const auto& [paths, bits] : {std::pair{1U, 1U},
                                      {2U, 1U},
                                      {3U, 2U},
                                      {4U, 2U},
                                      {5U, 3U},
                                      {1'000'000U, 20U}}) {
        head.paths = paths;
        EXPECT_EQ(head.numberBits(), bits) << paths;
    }
}

TEST(FormatTest, TokenEntriesFillThreeBytes) {
    const TokenEntry entry{maxTokenTextBytes - 1, 31, true};
    EXPECT_EQ(entry.packed(), 0xFFFFFFU);
    const TokenEntry back = TokenEntry::fromPacked(5U << 6U | 3U << 1U);
    EXPECT_EQ(back.offset, 5U);
    EXPECT_EQ(back.length, 3U);
    EXPECT_FALSE(back.ends);
}

}  // namespace
}  // namespace tessel::archive
