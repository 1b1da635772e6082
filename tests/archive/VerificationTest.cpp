#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <span>
#include <stop_token>
#include <string>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/Format.hpp"
#include "archive/Verification.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;

class VerificationTest : public testing::Test {
protected:
    archives::Paths paths_ = archives::sortedPaths(30'000);
    archives::Bytes bytes_ = archives::archiveOf(paths_);

    std::vector<ArchiveDamage> damages(unsigned threads) const {
        const ArchiveReader reader{ArchiveBytes(std::span(bytes_))};
        ScanOptions options;
        options.threads = threads;
        return findDamage(reader, options);
    }

    std::uint64_t inNames(std::uint64_t offset) const {
        const ArchiveReader reader{ArchiveBytes(std::span(bytes_))};
        const Segment& segment = reader.segment(0);
        return segment.pieces().inArchive(segment.offsetOf(Section::Names) +
                                          offset);
    }
};

TEST_F(VerificationTest, ASoundArchiveHasNoDamage) {
    EXPECT_TRUE(damages(1).empty());
    EXPECT_TRUE(damages(3).empty());
}

TEST_F(VerificationTest, TellsEachDamagedPieceOnce) {
    const std::uint64_t first = inNames(9000);
    const std::uint64_t second = inNames(9000 + 5 * 4096);
    for (const std::uint64_t at : {first, second, second + 4096})
        bytes_[at] ^= 1;
    EXPECT_EQ(damages(1), damages(4));
    for (const unsigned threads : {1U, 4U}) {
        const auto found = damages(threads);
        ASSERT_EQ(found.size(), 2U);
        EXPECT_LE(found[0].offset, first);
        EXPECT_GT(found[0].offset + found[0].size, first);
        EXPECT_EQ(found[0].size, 4096U);
        EXPECT_LE(found[1].offset, second);
        EXPECT_EQ(found[1].size, 8192U);  // neighbours are one
    }
}

TEST_F(VerificationTest, TellsASegmentThatCountsItsTextWrongly) {
    const std::uint64_t begin = archives::firstEntry(bytes_).offset;
    SegmentHead head = SegmentHead::unpack(std::span(bytes_).subspan(begin));
    std::uint64_t text = 0;
    for (const std::string& path : paths_) text += path.size();
    ASSERT_EQ(head.textBytes, text);
    for (const std::uint64_t wrong : {text - 1, text + 1}) {
        head.textBytes = wrong;
        archives::Bytes changed;
        head.pack(changed);
        std::ranges::copy(changed, &bytes_[begin]);
        const auto found = damages(4);
        EXPECT_EQ(damages(1), found);
        ASSERT_EQ(found.size(), 1U);
        EXPECT_EQ(found[0].offset, begin);
        EXPECT_EQ(found[0].what,
                  "A segment's head tells a wrong number of bytes.");
    }
}

TEST_F(VerificationTest, CanBeCancelled) {
    const ArchiveReader reader{ArchiveBytes(std::span(bytes_))};
    std::stop_source source;
    source.request_stop();
    ScanOptions options;
    options.cancel = source.get_token();
    EXPECT_THROW(findDamage(reader, options), CancelledException);
}

}  // namespace
}  // namespace tessel::archive
