// Numbers, partitions and repeated paths, without a tree.

#include <gtest/gtest.h>

#include "coder/PathNumbering.hpp"

namespace {

using tessel::PathNumbering;
using tessel::PathTrack;
using Ends = std::vector<std::uint64_t>;

void note(PathNumbering& numbering, std::size_t files) {
    PathTrack track = {1};
    numbering.reserveForPartition(track.size(), 0);
    numbering.notePartition(track, false, 0, files);
}

// What partitionAtOrAfter must answer.
std::size_t searched(const Ends& ends, std::size_t k, std::uint64_t number) {
    while (k < ends.size() && ends[k] < number) ++k;
    return k;
}

void compareSearch(const PathNumbering& numbering) {
    const Ends& ends = numbering.partitionEnds;
    for (std::size_t k = 0; k <= ends.size(); ++k)
        for (std::uint64_t number = 0; number < 15; ++number)
            EXPECT_EQ(numbering.partitionAtOrAfter(k, number),
                      searched(ends, k, number))
                << "from " << k << " for " << number;
}

TEST(PathNumbering, PartitionsEndAtThePathsCountedSoFar) {
    PathNumbering numbering;
    note(numbering, 3);
    note(numbering, 0);
    PathTrack track = {4, 5};
    numbering.reserveForPartition(2, 0);
    numbering.notePartition(track, true, 9, 2);
    EXPECT_EQ(numbering.partitionEnds, (Ends{3, 3, 5}));
    EXPECT_EQ(numbering.pathCount, 5U);
    EXPECT_EQ(numbering.partitionTracks[0], PathTrack{1});
    EXPECT_EQ(numbering.partitionTracks[2], (PathTrack{4, 5, 9}));
    EXPECT_EQ(numbering.maxPartitionTrackLength, 3U);
}

TEST(PathNumbering, TheSearchFindsWhatOneFromTheFrontFinds) {
    PathNumbering numbering;
    compareSearch(numbering);
    for (const std::size_t files : {1U, 0U, 0U, 2U, 3U, 0U, 4U}) {
        note(numbering, files);
        compareSearch(numbering);
    }
}

// A count that was set back, as deserializePathTree does, makes ends fall.
TEST(PathNumbering, EndsThatFallAreNoticedWhenAPartitionIsAdded) {
    PathNumbering numbering;
    note(numbering, 2);
    note(numbering, 8);
    numbering.pathCount = 2;
    note(numbering, 1);
    EXPECT_EQ(numbering.partitionEnds, (Ends{2, 10, 3}));
    compareSearch(numbering);
    note(numbering, 9);
    compareSearch(numbering);
}

TEST(PathNumbering, EndsThatFallAreNoticedWhenTheyAreCheckedAnew) {
    PathNumbering numbering;
    numbering.partitionEnds = {2, 10, 3, 12};
    numbering.checkEnds();
    compareSearch(numbering);
    const PathNumbering copy = numbering;
    compareSearch(copy);
    numbering.partitionEnds = {2, 3, 10, 12};
    numbering.checkEnds();
    compareSearch(numbering);
}

// A count that jumps asks for no table of its size: what a partition may take
// follows from its files.
TEST(PathNumbering, AHugeCountTakesNoMemory) {
    for (const std::uint64_t count :
         {std::uint64_t{1} << 33, std::uint64_t{1} << 45,
          ~std::uint64_t{0} - 100}) {
        PathNumbering numbering;
        note(numbering, 3);
        numbering.pathCount = count;
        for (int i = 0; i < 20; ++i) note(numbering, 2);
        const Ends& ends = numbering.partitionEnds;
        for (std::size_t k = 0; k < ends.size(); ++k)
            EXPECT_EQ(numbering.partitionAtOrAfter(0, ends[k]), k);
        EXPECT_EQ(numbering.partitionAtOrAfter(0, 4), 1U);
        EXPECT_LT(numbering.partitionBytes(), 2000U);
    }
}

// Ends on both sides of 2^32, which a count that was set by hand leads to.
TEST(PathNumbering, NumbersBeyond32BitsAreFound) {
    constexpr std::uint64_t border = std::uint64_t{1} << 32;
    PathNumbering numbering;
    note(numbering, 3);
    numbering.pathCount = border - 100;
    for (std::size_t i = 0; i < 60; ++i) note(numbering, i % 7);
    const Ends& ends = numbering.partitionEnds;
    ASSERT_LT(ends[1], border);
    ASSERT_GT(ends.back(), border);
    PathNumbering checked = numbering;
    checked.checkEnds();
    for (const PathNumbering& each : {numbering, checked})
        for (const std::uint64_t number :
             {std::uint64_t{0}, std::uint64_t{3}, std::uint64_t{4},
              border - 200, border - 1, border, border + 1, border + 3,
              ends.back(), ends.back() + 1, 2 * border, 2 * border + 3})
            for (std::size_t k = 0; k <= ends.size(); ++k)
                ASSERT_EQ(each.partitionAtOrAfter(k, number),
                          searched(ends, k, number))
                    << "from " << k << " for " << number;
}

// The same after a form whose last end is huge and whose ends fall.
TEST(PathNumbering, HugeEndsThatFallTakeNoMemory) {
    PathNumbering numbering;
    numbering.partitionEnds = {std::uint64_t{1} << 60, 5,
                               std::uint64_t{1} << 61};
    numbering.pathCount = numbering.partitionEnds.back();
    numbering.checkEnds();
    note(numbering, 2);
    compareSearch(numbering);
    EXPECT_LT(numbering.partitionBytes(), 2000U);
}

TEST(PathNumbering, OnlyAPathThatExistedIsADuplicate) {
    PathNumbering numbering;
    PathTrack track = {1, 2};
    numbering.noteWholePath(track, false);
    EXPECT_FALSE(numbering.hasDuplicate(1));
    numbering.noteWholePath(track, true);
    EXPECT_TRUE(numbering.hasDuplicate(2));
    EXPECT_FALSE(numbering.hasDuplicate(3));
    EXPECT_EQ(numbering.duplicates.at(2), (PathTrack{1, 2}));
    EXPECT_EQ(numbering.maxDuplicateTrackLength, 2U);
    EXPECT_EQ(numbering.maxDuplicatePathNumber, 2U);
    EXPECT_EQ(numbering.pathCount, 2U);
    EXPECT_GT(numbering.duplicateBytes(), 2 * sizeof(std::uint64_t));
}

}  // namespace
