#include <gtest/gtest.h>

#include <string>

#include "archive/Format.hpp"
#include "archive/SegmentWriter.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

Bytes segmentOf(const std::vector<std::string>& paths,
                const SegmentOptions& options = {}) {
    SegmentList list;
    for (const std::string& path : paths) list.add(SplitPath::of(path));
    Workers workers(1, {});
    return buildSegment(list, options, workers);
}

Bytes sectionOf(const Bytes& segment, Section section) {
    const SegmentHead head = SegmentHead::unpack(segment);
    const auto start = static_cast<std::ptrdiff_t>(
        segment.size() - head.bodyBytes() + head.offsetOf(section));
    return {segment.begin() + start,
            segment.begin() + start +
                static_cast<std::ptrdiff_t>(head.bytesOf(section))};
}

// The example of docs/archive-format.md, byte for byte.
TEST(SegmentWriterTest, WritesTheDocumentedExample) {
    const Bytes segment = segmentOf({"a/bc", "a/bd", "b"});
    EXPECT_EQ(segment.size(), 728U);
    const auto section = [&](Section s) { return sectionOf(segment, s); };
    EXPECT_EQ(section(Section::TokenCodes), (Bytes{0, 0, 1, 2, 0, 0, 1, 2, 0}));
    EXPECT_EQ(section(Section::TokenEntries),
              (Bytes{2, 0, 0, 0,    0, 0, 0x41, 0, 0, 0, 0, 0, 0, 0, 0,
                     0, 0, 0, 0x41, 0, 0, 0,    0, 0, 0, 0, 0, 0, 0, 0}));
    EXPECT_EQ(section(Section::TokenText), Bytes{'b'});
    EXPECT_EQ(
        section(Section::FolderHeads),
        (Bytes{0, 0, 0, 0, 0, 0, 0, 0, 2, 0, 0, 0, 1, 0, 0, 0, 'a', '/'}));
    EXPECT_EQ(section(Section::Names), (Bytes{0xB1, 0x80}));
    EXPECT_EQ(section(Section::Folders), (Bytes{0xB0, 0x97, 0x80}));
}

TEST(SegmentWriterTest, TheHeadCountsTheList) {
    const SegmentHead head =
        SegmentHead::unpack(segmentOf({"folder/x", "folder/name", "y"}));
    EXPECT_EQ(head.order, ListOrder::AsGiven);
    EXPECT_EQ(head.paths, 3U);
    EXPECT_EQ(head.folders, 2U);
    EXPECT_EQ(head.textBytes, 8U + 11 + 1);
    EXPECT_EQ(head.maxNameBytes, 4U);
    EXPECT_EQ(head.maxFolderBytes, 7U);
}

// Every 128th folder is a head, beside the block that first names it.
TEST(SegmentWriterTest, FolderHeadsKnowTheirBlocks) {
    std::vector<std::string> paths;
    for (int i = 1000; i < 1300; ++i) {
        paths.emplace_back(1, 'f');
        paths.back() += std::to_string(i);
        paths.back() += "/name";
    }
    const Bytes heads = sectionOf(segmentOf(paths), Section::FolderHeads);
    const Bytes table(heads.begin(), heads.begin() + 32);
    EXPECT_EQ(table,
              (Bytes{0,  0, 0, 0, 0,  0, 0, 0, 6,  0, 0, 0, 8,  0, 0, 0,
                     12, 0, 0, 0, 16, 0, 0, 0, 18, 0, 0, 0, 19, 0, 0, 0}));
    EXPECT_EQ(std::string(heads.begin() + 32, heads.end()),
              "f1000/f1128/f1256/");
}

TEST(SegmentWriterTest, OrderAndIndexAreInverse) {
    SegmentOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    // Jumps between two folders, so that sorting pays.
    const Bytes segment = segmentOf(
        {"b/1", "a/1", "b/0", "a/0", "b/2", "a/2", "b/3", "a/3"}, options);
    EXPECT_EQ(SegmentHead::unpack(segment).order, ListOrder::Rearranged);
    // Three bits each: 5 1 4 0 6 2 7 3, and 3 1 5 7 2 0 4 6.
    EXPECT_EQ(sectionOf(segment, Section::Order),
              (Bytes{0b10100110, 0b00001100, 0b10111011}));
    EXPECT_EQ(sectionOf(segment, Section::Index),
              (Bytes{0b01100110, 0b11110100, 0b00100110}));
}

TEST(SegmentWriterTest, ProgressRunsFromPartToPart) {
    SegmentOptions options;
    std::vector<double> shares;
    options.progress = [&](double share) { shares.push_back(share); };
    segmentOf({"a/b", "a/c"}, options);
    EXPECT_GE(shares.size(), 5U);
    EXPECT_TRUE(std::is_sorted(shares.begin(), shares.end()));
    EXPECT_LE(shares.back(), 1);
}

}  // namespace
}  // namespace tessel::archive
