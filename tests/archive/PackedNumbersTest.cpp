#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/PackedNumbers.hpp"
#include "tests/archive/Archives.hpp"
#include "tests/archive/ChangedSegment.hpp"

namespace tessel::archive {
namespace {

using archives::Paths;

// Forty paths: numbers of six bits.
Paths scattered() { return archives::scatteredPaths(40); }

ArchiveOptions withIndex() {
    ArchiveOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    return options;
}

TEST(PackedNumbers, OrderAndIndexAreInverse) {
    const archives::OpenArchive archive(scattered(), withIndex());
    const Segment& segment = archive.segment();
    ASSERT_EQ(segment.head().order, ListOrder::Rearranged);
    ASSERT_EQ(segment.head().numberBits(), 6U);
    const PackedNumbers order(segment, Section::Order);
    const PackedNumbers index(segment, Section::Index);
    std::vector<std::uint32_t> places;
    for (std::uint64_t i = 0; i < 40; ++i) {
        order.prefetch(i);
        places.push_back(order.at(i));
        EXPECT_EQ(index.at(places.back()), i);
    }
    EXPECT_NE(places, [] {
        std::vector<std::uint32_t> same;
        for (std::uint32_t i = 0; i < 40; ++i) same.push_back(i);
        return same;
    }());
}

TEST(PackedNumbers, ANumberThatIsTooLargeIsDamage) {
    // Four numbers of six bits are three bytes: all are 63 then.
    const archives::ChangedSegment changed(
        scattered(), withIndex(),
        [](const SegmentHead& head, archives::Bytes& body) {
            for (std::size_t i = 0; i < 3; ++i)
                body[head.offsetOf(Section::Order) + i] = 0xFF;
        });
    const Segment segment(changed.bytes(), changed.entry());
    const PackedNumbers order(segment, Section::Order);
    for (std::uint64_t i = 0; i < 4; ++i)
        EXPECT_THROW(order.at(i), DamagedArchiveException);
    EXPECT_LT(order.at(4), 40U);
}

TEST(PackedNumbers, AreSortedIntoRanges) {
    const archives::OpenArchive archive(scattered(), withIndex());
    const PackedNumbers index(archive.segment(), Section::Index);
    EXPECT_EQ(sortedNumbers(index, {0, 40}),
              (std::vector<NumberRange>{{0, 40}}));
    EXPECT_EQ(sortedNumbers(index, {5, 5}), std::vector<NumberRange>{});
    // The eight paths of folder 0 are every fifth one.
    std::vector<NumberRange> expected;
    for (std::uint64_t i = 0; i < 40; i += 5) expected.push_back({i, i + 1});
    EXPECT_EQ(sortedNumbers(index, {0, 8}), expected);
}

}  // namespace
}  // namespace tessel::archive
