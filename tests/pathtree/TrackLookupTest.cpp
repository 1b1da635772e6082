// Tracks followed without copies. (BPathTreeLookupTest has what is copied.)

#include <gtest/gtest.h>

#include <stdexcept>

#include "pathtree/BPathTree.hpp"
#include "pathtree/TrackLookup.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using tessel::BPathTree;
using tessel::PathTrack;
using tessel::TrackLookup;
using Names = std::vector<std::string>;
using Positions = std::vector<std::uint64_t>;

// What visitBatch visits: folder components, then files.
std::pair<Names, Names> visited(const BPathTree& tree, const PathTrack& track,
                                const Positions& offsets) {
    std::pair<Names, Names> seen;
    TrackLookup(*tree.root)
        .visitBatch(
            track, offsets,
            [&seen](tessel::ComponentView value) {
                EXPECT_TRUE(seen.second.empty());
                seen.first.push_back(support::textOf(value));
            },
            [&seen](tessel::ComponentView value) {
                seen.second.push_back(support::textOf(value));
            });
    return seen;
}

TEST(TrackLookup, ABatchIsVisitedWithoutItsFirstFileAsAFolder) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    addBatch(tree, {"a", "b"}, {"h", "i"});
    const Names folder = {"a", "b"};
    EXPECT_EQ(visited(tree, {0, 0}, {2, 1}),
              (std::pair{folder, Names{"g", "f"}}));
    EXPECT_EQ(visited(tree, {0, 0, 2}, {2, 1}),
              (std::pair{folder, Names{"i", "h"}}));
    EXPECT_EQ(visited(tree, {0, 0, 2}, {}), (std::pair{folder, Names{}}));
}

TEST(TrackLookup, VisitsOutsideTheTreeAreOutOfRange) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    EXPECT_THROW(visited(tree, {1}, {1}), std::out_of_range);
    EXPECT_THROW(visited(tree, {0, 0, 0}, {1}), std::out_of_range);
    EXPECT_THROW(visited(tree, {0}, {3}), std::out_of_range);
    EXPECT_THROW(visited(BPathTree(), {}, {}), std::out_of_range);
}

TEST(TrackLookup, ATrackIsVisitedFromTheRootDown) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    const TrackLookup lookup(*tree.root);
    const auto follow = [&lookup](const PathTrack& track) {
        Names seen;
        lookup.visitTrack(track, [&seen](tessel::ComponentView value) {
            seen.push_back(support::textOf(value));
        });
        return seen;
    };
    EXPECT_EQ(follow({0, 0, 1}), (Names{"a", "b", "g"}));
    EXPECT_EQ(follow({0}), (Names{"a"}));
    EXPECT_THROW(follow({0, 0, 2}), std::out_of_range);
    EXPECT_THROW(follow({}), tessel::EmptyPathForTraverseException);
    const BPathTree empty;
    EXPECT_THROW(TrackLookup(*empty.root)
                     .visitTrack(PathTrack{}, [](tessel::ComponentView) {}),
                 tessel::NoTreeToTraverseException);
}

}  // namespace
