#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/Format.hpp"
#include "archive/Salvage.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::archiveOf;
using archives::Bytes;
using archives::Paths;

// Salvages, and checks that each path comes under its own number, and that
// what is kept and what is lost are together the first `expected` numbers.
SalvageReport salvageOf(const Bytes& bytes, const Paths& paths,
                        std::uint64_t expected) {
    std::vector<bool> seen(expected);
    std::uint64_t next = 0;
    const SalvageReport report =
        salvage(bytes, [&](auto number, std::string_view path) {
            ASSERT_GE(number, next);
            ASSERT_LT(number, expected);
            ASSERT_EQ(path, paths[number]);
            next = number + 1;
            seen[number] = true;
        });
    for (const NumberRange range : report.lost)
        for (auto n = range.begin; n < range.end; ++n) {
            EXPECT_FALSE(seen[n]);
            seen[n] = true;
        }
    EXPECT_EQ(std::ranges::count(seen, true),
              static_cast<std::ptrdiff_t>(expected));
    return report;
}

std::uint64_t lostNumbers(const SalvageReport& report) {
    std::uint64_t count = 0;
    for (const NumberRange range : report.lost)
        count += range.end - range.begin;
    return count;
}

// The byte of the archive where a section of its first segment starts.
std::uint64_t startOf(Section section, const Bytes& bytes) {
    const auto segment = std::span(bytes).subspan(fileHeaderBytes);
    const SegmentHead head = SegmentHead::unpack(segment);
    return fileHeaderBytes + segmentHeadBytes + head.sumTreeBytes() +
           head.offsetOf(section);
}

class SalvageTest : public testing::Test {
protected:
    Paths paths_ = archives::sortedPaths(30'000);
    Bytes whole_ = archiveOf(paths_);
    Bytes bytes_ = whole_;
};

TEST_F(SalvageTest, ADamagedPieceOfNamesCostsItsBlocks) {
    bytes_[startOf(Section::Names, bytes_) + 10'000] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_GT(lostNumbers(report), 0U);
    EXPECT_LT(lostNumbers(report), 3000U);
    ASSERT_EQ(report.damages.size(), 1U);
    EXPECT_EQ(report.damages[0].size, 4096U);
    EXPECT_TRUE(report.complete);
}

TEST_F(SalvageTest, ADamagedPieceOfFoldersCostsTheirPaths) {
    bytes_[startOf(Section::Folders, bytes_) + 2000] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_GT(lostNumbers(report), 0U);
    EXPECT_LT(lostNumbers(report), paths_.size());
}

TEST_F(SalvageTest, ADamagedTableCostsItsSegment) {
    bytes_ = archiveOf(paths_, archives::segmentsOf(10'000));
    bytes_[startOf(Section::TokenText, bytes_)] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_EQ(report.lost, (std::vector<NumberRange>{{0, 10'000}}));
}

TEST_F(SalvageTest, ReadsOnWithoutTheHeader) {
    bytes_ = archiveOf(paths_, archives::segmentsOf(10'000));
    bytes_[20] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_EQ(report.kept, paths_.size());
    EXPECT_TRUE(report.complete);
    EXPECT_EQ(report.damages.size(), 1U);
}

TEST_F(SalvageTest, ReadsOnWithoutADirectoryEntry) {
    bytes_ = archiveOf(paths_, archives::segmentsOf(10'000));
    bytes_[bytes_.size() - 2 * segmentEntryBytes] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_EQ(report.kept, paths_.size());
}

TEST_F(SalvageTest, ReadsOnAfterALostHead) {
    bytes_ = archiveOf(paths_, archives::segmentsOf(10'000));
    bytes_[fileHeaderBytes + 5] ^= 1;
    const auto report = salvageOf(bytes_, paths_, paths_.size());
    EXPECT_EQ(report.lost, (std::vector<NumberRange>{{0, 10'000}}));
}

TEST_F(SalvageTest, ReadsWhatIsLeftOfACutArchive) {
    bytes_ = archiveOf(paths_, archives::segmentsOf(10'000));
    for (const std::size_t cut : {std::size_t{1}, segmentEntryBytes * 3,
                                  std::size_t{1000}, bytes_.size() / 2}) {
        const Bytes rest(bytes_.begin(),
                         bytes_.end() - static_cast<std::ptrdiff_t>(cut));
        const auto report = salvageOf(rest, paths_, paths_.size());
        EXPECT_FALSE(report.damages.empty());
        EXPECT_GE(report.kept, 10'000U);
    }
}

TEST_F(SalvageTest, EndsWhenTheVisitorHasEnough) {
    int shown = 0;
    salvage(bytes_, [&](auto, auto) { return ++shown < 5; });
    EXPECT_EQ(shown, 5);
}

TEST_F(SalvageTest, RefusesWhatIsNoArchive) {
    const auto nobody = [](auto, auto) { FAIL(); };
    EXPECT_THROW(salvage(Bytes(), nobody), DamagedArchiveException);
    EXPECT_THROW(salvage(Bytes(500, 7), nobody), DamagedArchiveException);
}

TEST_F(SalvageTest, KeepsWhatTheVisitorThrows) {
    const auto refuse = [](auto, auto) {
        throw DamagedArchiveException(1, "Not of this archive.");
    };
    EXPECT_THROW(salvage(bytes_, refuse), DamagedArchiveException);
}

}  // namespace
}  // namespace tessel::archive
