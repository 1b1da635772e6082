#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/NameDecoder.hpp"
#include "archive/PathBuffer.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

class NameReader {
public:
    explicit NameReader(const Segment& segment)
        : buffer_(segment.head().maxNameBytes + NameDecoder::slack),
          names_(segment, buffer_.data()) {}

    NameDecoder* operator->() { return &names_; }

private:
    PathBuffer buffer_;
    NameDecoder names_;
};

// Each kind of operation: the same prefix again, shorter and longer ones, long
// ones, the next folder, folders from before; names that end where their
// predecessor goes on, and the other way round.
Paths allOperations() {
    const std::string longName(200, 'n');
    return {"a/abc",
            "a/abd",
            "a/abe",
            "a/ab",
            "a/abcd",
            "b/x",
            "a/abcd",
            "c/" + longName,
            "c/" + longName + 'x',
            "c/" + longName + 'y',
            "c/" + longName,
            "b/",
            "b/\xFF\x01",
            "a/",
            "a/abc"};
}

std::string nameOf(const std::string& path) {
    return path.substr(path.rfind('/') + 1);
}

TEST(NameDecoder, DecodesEveryOperation) {
    const Paths list = allOperations();
    const OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::AsGiven);
    NameReader names(archive.segment());
    names->start(archive.segment().nameBlock(0));
    constexpr std::uint32_t folders[] = {0, 0, 0, 0, 0, 1, 0, 2,
                                         2, 2, 2, 1, 1, 0, 0};
    constexpr std::uint32_t seen[] = {1, 1, 1, 1, 1, 2, 2, 3,
                                      3, 3, 3, 3, 3, 3, 3};
    for (std::size_t i = 0; i < list.size(); ++i) {
        names->next();
        EXPECT_EQ(names->name(), nameOf(list[i])) << i;
        EXPECT_EQ(names->length(), nameOf(list[i]).size()) << i;
        EXPECT_EQ(names->folder(), folders[i]) << i;
        EXPECT_EQ(names->seen(), seen[i]) << i;
        EXPECT_EQ(names->isAtEnd(), i + 1 == list.size()) << i;
    }
}

TEST(NameDecoder, StartsAtAnyBlock) {
    const Paths list = archives::sortedPaths(80);
    const OpenArchive archive(list);
    NameReader names(archive.segment());
    for (const std::uint32_t block : {4U, 0U, 2U, 2U, 3U}) {
        names->start(archive.segment().nameBlock(block));
        for (std::size_t i = 0; i < 16; ++i) {
            names->next();
            EXPECT_EQ(names->name(), nameOf(list[std::size_t{16} * block + i]));
        }
        EXPECT_TRUE(names->isAtEnd());
    }
}

// Decodes all blocks as far as they go. Returns whether some name is damaged.
bool isRefused(const Segment& segment) {
    bool refused = false;
    NameReader names(segment);
    for (std::uint32_t block = 0; block < segment.nameBlocks(); ++block) try {
            names->start(segment.nameBlock(block));
            for (unsigned i = 0; i < segment.head().namesPerBlock; ++i) {
                names->next();
                EXPECT_LE(names->length(), segment.head().maxNameBytes);
                EXPECT_LE(names->seen(), segment.head().folders);
            }
        } catch (const DamagedArchiveException&) {
            refused = true;
        }
    return refused;
}

// Whatever the bits are: a name within the longest length, or damage.
TEST(NameDecoder, StaysWithinItsBoundsOnAnyBits) {
    const archives::Bytes archive = archives::archiveOf(allOperations());
    const OpenArchive sound(allOperations());
    const std::uint64_t bytes = sound.segment().bytesOf(Section::Names);
    unsigned refused = 0;
    for (std::uint64_t at = 0; at < bytes; at += 2)
        for (const unsigned bits : {0x01U, 0x80U, 0xFFU}) {
            const archives::ChangedSegment changed(
                archive, archives::flip(Section::Names, at,
                                        static_cast<std::uint8_t>(bits)));
            if (isRefused(Segment(changed.bytes(), changed.entry()))) ++refused;
        }
    EXPECT_GT(refused, 0U);
}

}  // namespace
}  // namespace tessel::archive
