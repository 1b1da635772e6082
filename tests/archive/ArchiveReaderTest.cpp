#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/ArchiveReader.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;
using Numbers = std::vector<std::uint64_t>;

// A list that is stored in place and one that is rearranged.
std::vector<Paths> lists() {
    return {archives::sortedPaths(50), archives::scatteredPaths(50)};
}

TEST(ArchiveReader, FindsTheSegmentOfANumber) {
    const OpenArchive archive(archives::sortedPaths(50),
                              archives::segmentsOf(20));
    const ArchiveReader& reader = archive.reader();
    ASSERT_EQ(reader.segmentCount(), 3U);
    EXPECT_EQ(reader.size(), 50U);
    EXPECT_EQ(reader.segmentOf(0), 0U);
    EXPECT_EQ(reader.segmentOf(19), 0U);
    EXPECT_EQ(reader.segmentOf(20), 1U);
    EXPECT_EQ(reader.segmentOf(39), 1U);
    EXPECT_EQ(reader.segmentOf(49), 2U);
}

TEST(ArchiveReader, ReadsSinglePathsOfAllSegments) {
    for (const Paths& list : lists()) {
        const OpenArchive archive(list, archives::segmentsOf(30));
        std::string path = "overwritten";
        for (std::uint64_t i = 0; i < list.size(); ++i) {
            archive.reader().read(i, path);
            EXPECT_EQ(path, list[i]);
        }
    }
}

TEST(ArchiveReader, ReadsNumbersAcrossSegmentsAsAsked) {
    const Numbers numbers = {0, 49, 29, 30, 31, 30, 5, 5, 40, 39};
    for (const Paths& list : lists()) {
        const OpenArchive archive(list, archives::segmentsOf(30));
        Numbers shown;
        EXPECT_TRUE(archive.reader().read(
            numbers, [&](std::uint64_t number, std::string_view path) {
                shown.push_back(number);
                EXPECT_EQ(path, list[number]);
            }));
        EXPECT_EQ(shown, numbers);
    }
}

TEST(ArchiveReader, ReadsRangesAcrossSegments) {
    for (const Paths& list : lists()) {
        const OpenArchive archive(list, archives::segmentsOf(30));
        std::uint64_t next = 15;
        EXPECT_TRUE(archive.reader().read(
            15, 45, [&](std::uint64_t number, std::string_view path) {
                EXPECT_EQ(number, next++);
                EXPECT_EQ(path, list[number]);
            }));
        EXPECT_EQ(next, 45U);
    }
}

TEST(ArchiveReader, EndsAVisitWhenAsked) {
    for (const Paths& list : lists()) {
        const OpenArchive archive(list, archives::segmentsOf(30));
        unsigned shown = 0;
        const auto stopAtThird = [&](std::uint64_t, std::string_view) {
            return ++shown < 3;
        };
        EXPECT_FALSE(archive.reader().read(28, 45, stopAtThird));
        EXPECT_EQ(shown, 3U);
        shown = 0;
        EXPECT_FALSE(
            archive.reader().read(Numbers{30, 2, 31, 0, 7}, stopAtThird));
        EXPECT_EQ(shown, 3U);
    }
}

TEST(ArchiveReader, RefusesDamageToASegmentsHead) {
    archives::Bytes bytes = archives::archiveOf({"a", "b"});
    EXPECT_NO_THROW(ArchiveReader(ArchiveBytes{archives::Bytes(bytes)}));
    bytes[fileHeaderBytes] ^= 1;
    EXPECT_THROW(ArchiveReader(ArchiveBytes{archives::Bytes(bytes)}),
                 DamagedArchiveException);
}

TEST(ArchiveReader, PlacesOfRearrangedPathsFollowTheOrder) {
    const Paths list = archives::scatteredPaths(50);
    const OpenArchive archive(list);
    const Segment& segment = archive.segment();
    ASSERT_FALSE(isInPlace(segment));
    std::vector<bool> taken(list.size());
    for (std::uint64_t i = 0; i < list.size(); ++i) {
        const std::uint64_t place = placeOf(segment, i);
        ASSERT_LT(place, list.size());
        EXPECT_FALSE(taken[place]);
        taken[place] = true;
    }
}

}  // namespace
}  // namespace tessel::archive
