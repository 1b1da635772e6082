#include <gtest/gtest.h>

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/SegmentRules.hpp"
#include "archive/SumTree.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::Bytes;

// A segment whose body was changed and whose checksums were mended.
class ChangedSegment {
public:
    template <class Change>
    ChangedSegment(const archives::Paths& paths, Change change)
        : ChangedSegment(paths, ArchiveOptions(), change) {}

    template <class Change>
    ChangedSegment(const archives::Paths& paths, const ArchiveOptions& options,
                   Change change) {
        const Bytes whole = archives::archiveOf(paths, options);
        const FileHeader header = FileHeader::unpack(whole);
        entry_ = SegmentEntry::unpack(
            std::span(whole).subspan(header.directoryOffset), 0);
        const auto segment =
            std::span(whole).subspan(entry_.offset, entry_.bytes);
        SegmentHead head = SegmentHead::unpack(segment);
        const auto stored = segment.last(head.bodyBytes());
        Bytes body(stored.begin(), stored.end());
        change(head, body);
        std::vector<std::uint64_t> sums;
        while (sums.size() << head.pieceShift < body.size())
            sums.push_back(
                SumTree::pieceSum(body, head.pieceShift, 0, sums.size()));
        const auto levels = SumTree::levelsAbove(sums, head.pieceShift);
        head.topSum = levels.top;
        head.pack(bytes_);
        bytes_.insert(bytes_.end(), levels.stored.begin(), levels.stored.end());
        bytes_.insert(bytes_.end(), body.begin(), body.end());
        entry_.bytes = bytes_.size();
    }

    // All rules but those of the head's counts.
    void check() const {
        const Segment segment(bytes_, entry_);
        const SegmentRules rules(segment);
        rules.checkPadding();
        rules.checkFolders(0, segment.folderBlocks());
        rules.checkNames(0, segment.nameBlocks());
        rules.checkFolderHeads();
        rules.checkOrder();
    }

private:
    Bytes bytes_;
    SegmentEntry entry_;
};

// Changes a byte of a section.
auto flip(Section section, std::uint64_t offset, std::uint8_t bits) {
    return [=](const SegmentHead& head, Bytes& body) {
        body[head.offsetOf(section) + offset] ^= bits;
    };
}

const archives::Paths& sorted() {
    static const archives::Paths paths = archives::sortedPaths(2000);
    return paths;
}

TEST(SegmentRules, HoldForWhatAWriterWrites) {
    const auto nothing = [](auto&, auto&) {};
    EXPECT_NO_THROW(ChangedSegment(sorted(), nothing).check());
    EXPECT_NO_THROW(
        ChangedSegment(archives::shuffled(sorted()), nothing).check());
    EXPECT_NO_THROW(ChangedSegment(archives::nastyPaths(), nothing).check());
}

TEST(SegmentRules, PaddingIsZero) {
    EXPECT_THROW(
        ChangedSegment(sorted(), [](auto&, Bytes& body) { body.back() = 1; })
            .check(),
        DamagedArchiveException);
}

TEST(SegmentRules, GroupsFitTheirBlocks) {
    // Bytes 0 to 3 are the first block's offset, 4 to 7 the folders before it,
    // 8 the folders it names first, 24 its length.
    for (const std::uint64_t offset : {0U, 4U, 8U, 24U, 30U})
        EXPECT_THROW(
            ChangedSegment(sorted(), flip(Section::NameGroups, offset, 1))
                .check(),
            DamagedArchiveException)
            << offset;
    for (const std::uint64_t offset : {0U, 4U, 9U})
        EXPECT_THROW(
            ChangedSegment(sorted(), flip(Section::FolderGroups, offset, 1))
                .check(),
            DamagedArchiveException)
            << offset;
}

TEST(SegmentRules, FolderHeadsAreFolders) {
    for (const std::uint64_t offset : {0U, 4U, 8U, 12U})
        EXPECT_THROW(
            ChangedSegment(sorted(), flip(Section::FolderHeads, offset, 1))
                .check(),
            DamagedArchiveException)
            << offset;
}

TEST(SegmentRules, AnIndexIsInOrder) {
    ArchiveOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    for (const auto& list : {archives::inFolderRuns(2000),
                             archives::shuffled(archives::sortedPaths(2000))})
        EXPECT_THROW(
            ChangedSegment(list, options, flip(Section::Index, 5, 0x10))
                .check(),
            DamagedArchiveException);
}

TEST(SegmentRules, AnOrderHoldsEachNumberOnce) {
    archives::Paths list;
    for (int i = 0; i < 3000; ++i)
        list.push_back(std::to_string(i % 30) + "/name" + std::to_string(i));
    list = archives::shuffled(list);
    const archives::OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::Rearranged);
    EXPECT_THROW(ChangedSegment(list, flip(Section::Order, 5, 0x10)).check(),
                 DamagedArchiveException);
}

}  // namespace
}  // namespace tessel::archive
