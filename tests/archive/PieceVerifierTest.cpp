#include <gtest/gtest.h>

#include <cstdint>
#include <span>

#include "archive/ArchiveExceptions.hpp"
#include "archive/PieceVerifier.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

class PieceVerifierTest : public testing::Test {
protected:
    archives::Bytes archive_ =
        archives::archiveOf(archives::sortedPaths(20'000));
    SegmentEntry entry_ = archives::firstEntry(archive_);
    std::span<std::uint8_t> bytes_ =
        std::span(archive_).subspan(entry_.offset, entry_.bytes);
    SegmentHead head_ = SegmentHead::unpack(bytes_);
    std::uint64_t bodyStart_ = entry_.bytes - head_.bodyBytes();

    PieceVerifier verifier() const { return {bytes_, head_, entry_.offset}; }
};

TEST_F(PieceVerifierTest, AllPiecesOfASoundBodyAreSound) {
    const PieceVerifier pieces = verifier();
    ASSERT_GT(pieces.pieces(), 10U);
    pieces.require(0, pieces.body().size());
    std::uint64_t bytes = 0;
    for (std::uint64_t p = 0; p < pieces.pieces(); ++p) {
        EXPECT_TRUE(pieces.isSound(p));
        EXPECT_EQ(pieces.startOf(p), bytes);
        bytes += pieces.sizeOf(p);
    }
    EXPECT_EQ(bytes, pieces.body().size());
}

TEST_F(PieceVerifierTest, OnlyWhatTouchesADamagedPieceIsRefused) {
    constexpr std::uint64_t at = 3 * 4096 + 17;
    bytes_[bodyStart_ + at] ^= 0x10;
    const PieceVerifier pieces = verifier();
    EXPECT_FALSE(pieces.isSound(3));
    EXPECT_NO_THROW(pieces.require(0, 3 * 4096));
    EXPECT_NO_THROW(pieces.require(4 * 4096, pieces.body().size()));
    EXPECT_NO_THROW(pieces.require(at, at));  // no bytes
    for (int again = 0; again < 2; ++again) {
        try {
            pieces.require(3 * 4096 - 1, 3 * 4096 + 1);
            FAIL();
        } catch (const DamagedArchiveException& damage) {
            EXPECT_EQ(damage.offset(), entry_.offset + bodyStart_ + 3 * 4096);
        }
    }
}

// Pieces of 512 bytes need a second table, of the checksums of the first one.
TEST(PieceVerifierOfSmallPieces, ChecksEveryTableOfChecksums) {
    const archives::ChangedSegment changed(
        archives::sortedPaths(20'000),
        [](SegmentHead& head, archives::Bytes&) { head.pieceShift = 9; });
    archives::Bytes bytes = changed.bytes();
    const SegmentHead head = SegmentHead::unpack(bytes);
    ASSERT_GT(head.sumTreeBytes(), 8 * (head.bodyBytes() / 512 + 1));
    const auto verifier = [&] { return PieceVerifier(bytes, head, 0); };
    {
        const PieceVerifier pieces = verifier();
        for (std::uint64_t p = 0; p < pieces.pieces(); ++p)
            ASSERT_TRUE(pieces.isSound(p)) << p;
    }
    for (std::uint64_t i = 0; i < head.sumTreeBytes(); i += 100) {
        bytes[segmentHeadBytes + i] ^= 1;
        EXPECT_THROW(verifier(), DamagedArchiveException) << i;
        bytes[segmentHeadBytes + i] ^= 1;
    }
}

TEST_F(PieceVerifierTest, RemembersWhatWasSound) {
    const PieceVerifier pieces = verifier();
    pieces.require(0, 1);
    bytes_[bodyStart_] ^= 1;
    EXPECT_NO_THROW(pieces.require(0, 1));
    EXPECT_FALSE(pieces.isSound(0));
}

TEST_F(PieceVerifierTest, RefusesDamagedLevels) {
    for (std::uint64_t at = segmentHeadBytes; at < bodyStart_; at += 5) {
        bytes_[at] ^= 0x80;
        EXPECT_THROW(verifier(), DamagedArchiveException) << at;
        bytes_[at] ^= 0x80;
    }
    EXPECT_NO_THROW(verifier());
}

}  // namespace
}  // namespace tessel::archive
