#include <gtest/gtest.h>

#include <algorithm>

#include "archive/SegmentBody.hpp"
#include "archive/SumTree.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

SegmentHead smallHead() {
    SegmentHead head;
    head.paths = 3;
    head.folders = 1;
    head.pieceShift = 9;
    return head;
}

TEST(SegmentBodyTest, JoinsPartsAndAlignsSections) {
    SegmentBody body;
    body.add(Section::Names, {4, 5});
    body.add(Section::TokenCodes, {1, 2, 3});
    body.add(Section::Names, {6});
    SegmentHead head = smallHead();
    Workers workers(2, {});
    const Bytes segment = body.finish(head, workers);
    EXPECT_EQ(head.bytesOf(Section::Names), 3U);
    ASSERT_EQ(segment.size(), head.segmentBytes());
    Bytes expected = {1, 2, 3, 0, 0, 0, 0, 0, 4, 5, 6, 0, 0, 0, 0, 0};
    expected.resize(expected.size() + bodyGuardBytes);
    EXPECT_EQ(Bytes(segment.begin() + segmentHeadBytes, segment.end()),
              expected);
}

TEST(SegmentBodyTest, HeadAndSumsFitTheBody) {
    SegmentBody body;
    Bytes part(2000);
    std::ranges::fill(part, std::uint8_t{7});
    for (int i = 0; i < 50; ++i) body.add(Section::Folders, part);
    SegmentHead head = smallHead();
    Workers workers(3, {});
    const Bytes segment = body.finish(head, workers);
    const SegmentHead stored = SegmentHead::unpack(segment);
    EXPECT_EQ(stored.sectionBytes, head.sectionBytes);
    const auto bodyBytes = std::span(segment).last(stored.bodyBytes());
    std::vector<std::uint64_t> sums(
        SumTree::piecesIn(bodyBytes.size(), stored.pieceShift));
    for (std::size_t i = 0; i < sums.size(); ++i)
        sums[i] = SumTree::pieceSum(bodyBytes, stored.pieceShift, 0, i);
    const auto levels = SumTree::levelsAbove(sums, stored.pieceShift);
    EXPECT_EQ(stored.topSum, levels.top);
    EXPECT_TRUE(std::equal(levels.stored.begin(), levels.stored.end(),
                           segment.begin() + segmentHeadBytes));
}

}  // namespace
}  // namespace tessel::archive
