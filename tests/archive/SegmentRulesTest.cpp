#include <gtest/gtest.h>

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/SegmentRules.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::Bytes;
using archives::ChangedSegment;
using archives::flip;

// All rules but those of the head's counts.
void check(const ChangedSegment& changed) {
    const Segment segment(changed.bytes(), changed.entry());
    const SegmentRules rules(segment);
    rules.checkPadding();
    rules.checkFolders(0, segment.folderBlocks());
    rules.checkFoldersDiffer();
    rules.checkNames(0, segment.nameBlocks());
    rules.checkFolderHeads();
    rules.checkOrder();
}

// An archive of a sorted list, packed once per process.
const Bytes& sorted() {
    static const Bytes archive =
        archives::archiveOf(archives::sortedPaths(600));
    return archive;
}

TEST(SegmentRules, HoldForWhatAWriterWrites) {
    const auto nothing = [](auto&, auto&) {};
    EXPECT_NO_THROW(check(ChangedSegment(sorted(), nothing)));
    EXPECT_NO_THROW(check(ChangedSegment(
        archives::shuffled(archives::sortedPaths(600)), nothing)));
    EXPECT_NO_THROW(check(ChangedSegment(archives::nastyPaths(), nothing)));
}

TEST(SegmentRules, PaddingIsZero) {
    EXPECT_THROW(check(ChangedSegment(
                     sorted(),
                     [](auto&, Bytes& body) { body.at(body.size() - 1) = 1; })),
                 DamagedArchiveException);
}

TEST(SegmentRules, GroupsFitTheirBlocks) {
    // Bytes 0 to 3 are the first block's offset, 4 to 7 the folders before it,
    // 8 the folders it names first, 24 its length.
    for (const std::uint64_t offset : {0U, 4U, 8U, 24U, 30U})
        EXPECT_THROW(check(ChangedSegment(
                         sorted(), flip(Section::NameGroups, offset, 1))),
                     DamagedArchiveException)
            << offset;
    for (const std::uint64_t offset : {0U, 4U, 9U})
        EXPECT_THROW(check(ChangedSegment(
                         sorted(), flip(Section::FolderGroups, offset, 1))),
                     DamagedArchiveException)
            << offset;
}

TEST(SegmentRules, FolderHeadsAreFolders) {
    for (const std::uint64_t offset : {0U, 4U, 8U, 12U})
        EXPECT_THROW(check(ChangedSegment(
                         sorted(), flip(Section::FolderHeads, offset, 1))),
                     DamagedArchiveException)
            << offset;
}

TEST(SegmentRules, FoldersDiffer) {
    // Bytes of folders that no token shortens: a change of one bit turns one
    // folder into the other.
    const Bytes archive = archives::archiveOf({"a/x", "c/x"});
    const archives::OpenArchive sound({"a/x", "c/x"});
    unsigned equal = 0;
    for (unsigned bit = 0; bit < 8 * sound.segment().bytesOf(Section::Folders);
         ++bit) {
        const ChangedSegment changed(
            archive, flip(Section::Folders, bit / 8,
                          static_cast<std::uint8_t>(1U << (bit % 8))));
        const Segment segment(changed.bytes(), changed.entry());
        try {
            SegmentRules(segment).checkFoldersDiffer();
        } catch (const DamagedArchiveException& damage) {
            if (damage.cause() == std::string("A folder comes twice.")) ++equal;
        }
    }
    EXPECT_GT(equal, 0U);
}

TEST(SegmentRules, AnIndexIsInOrder) {
    ArchiveOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    for (const auto& list : {archives::inFolderRuns(2000),
                             archives::shuffled(archives::sortedPaths(2000))})
        EXPECT_THROW(
            check(ChangedSegment(list, options, flip(Section::Index, 5, 0x10))),
            DamagedArchiveException);
}

TEST(SegmentRules, AnOrderHoldsEachNumberOnce) {
    archives::Paths list;
    for (int i = 0; i < 3000; ++i)
        list.push_back(std::to_string(i % 30) + "/name" + std::to_string(i));
    list = archives::shuffled(list);
    const archives::OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::Rearranged);
    EXPECT_THROW(check(ChangedSegment(list, flip(Section::Order, 5, 0x10))),
                 DamagedArchiveException);
}

}  // namespace
}  // namespace tessel::archive
