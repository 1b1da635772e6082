#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <optional>

#include "archive/ArchiveExceptions.hpp"
#include "archive/SegmentSurvey.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

class SegmentSurveyTest : public testing::Test {
protected:
    archives::Bytes bytes_ = archives::archiveOf(archives::sortedPaths(900),
                                                 archives::segmentsOf(300));
    FileHeader header_ = FileHeader::unpack(bytes_);

    std::uint8_t& entry(std::size_t index) {
        return bytes_[header_.directoryOffset + index * segmentEntryBytes];
    }

    void expectAllSegments(std::size_t damages) const {
        const SegmentSurvey survey(bytes_);
        ASSERT_EQ(survey.segments().size(), 3U);
        for (std::uint64_t i = 0; i < 3; ++i) {
            EXPECT_EQ(survey.segments()[i].firstNumber, 300 * i);
            EXPECT_EQ(survey.segments()[i].paths, 300U);
        }
        EXPECT_EQ(survey.paths(), 900U);
        EXPECT_EQ(survey.endNumber(), 900U);
        EXPECT_EQ(survey.damages().size(), damages);
    }
};

TEST_F(SegmentSurveyTest, FindsAllSegmentsOfASoundArchive) {
    expectAllSegments(0);
}

TEST_F(SegmentSurveyTest, FindsThemWithoutTheHeader) {
    bytes_[9] ^= 1;
    expectAllSegments(1);
}

TEST_F(SegmentSurveyTest, FindsThemWithoutTheDirectory) {
    for (const std::size_t i : {0U, 1U, 2U}) entry(i) ^= 1;
    expectAllSegments(3);
}

TEST_F(SegmentSurveyTest, GoesOnAfterAHeadThatTheDirectoryKnows) {
    bytes_[header_.directoryOffset / 2] ^= 1;  // somewhere in a segment
    bytes_[fileHeaderBytes] ^= 1;
    expectAllSegments(0);
}

TEST_F(SegmentSurveyTest, SkipsWhatNothingTells) {
    bytes_[fileHeaderBytes] ^= 1;
    entry(0) ^= 1;
    const SegmentSurvey survey(bytes_);
    ASSERT_EQ(survey.segments().size(), 2U);
    EXPECT_EQ(survey.segments()[0].firstNumber, 300U);
}

TEST_F(SegmentSurveyTest, DoesNotKnowTheEndWithoutHeaderAndDirectory) {
    bytes_[9] ^= 1;
    entry(2) ^= 1;
    const SegmentSurvey survey(bytes_);
    EXPECT_EQ(survey.segments().size(), 3U);
    EXPECT_EQ(survey.paths(), std::nullopt);
}

TEST_F(SegmentSurveyTest, RefusesANewerVersion) {
    header_.version = 2;
    archives::Bytes bytes;
    header_.pack(bytes);
    EXPECT_THROW(SegmentSurvey{bytes}, UnsupportedArchiveVersionException);
}

}  // namespace
}  // namespace tessel::archive
