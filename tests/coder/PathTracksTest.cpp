// Packed tracks beside a list of lists.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "coder/PathTracks.hpp"

namespace {

using tessel::PathTrack;
using tessel::PathTracks;

rc::Gen<std::uint64_t> anyPosition() {
    return rc::gen::weightedOneOf<std::uint64_t>(
        {{4, rc::gen::inRange<std::uint64_t>(0, 130)},
         {2,
          rc::gen::map(rc::gen::inRange(0U, 64U),
                       [](unsigned bit) { return std::uint64_t{1} << bit; })},
         {1, rc::gen::map(rc::gen::inRange(0U, 64U), [](unsigned bits) {
              return ~std::uint64_t{0} >> bits;
          })}});
}

rc::Gen<PathTrack> anyTrack() {
    return rc::gen::weightedOneOf<PathTrack>(
        {{10, rc::gen::container<PathTrack>(anyPosition())},
         {1, rc::gen::map(anyPosition(), [](std::uint64_t position) {
              return PathTrack(200, position);
          })}});
}

// Many tracks share positions with the one before, all of them too.
std::vector<PathTrack> anyTracks() {
    auto tracks = *rc::gen::container<std::vector<PathTrack>>(anyTrack());
    for (std::size_t i = 1; i < tracks.size(); ++i) {
        const PathTrack& before = tracks[i - 1];
        const std::size_t shared =
            *rc::gen::inRange<std::size_t>(0, 2 * before.size() + 1);
        if (shared > before.size()) continue;
        if (*rc::gen::arbitrary<bool>()) tracks[i].clear();
        tracks[i].insert(tracks[i].begin(), before.begin(),
                         before.begin() + static_cast<std::ptrdiff_t>(shared));
    }
    return tracks;
}

RC_GTEST_PROP(PathTracks, EqualAListOfLists,
              (const std::vector<int>& /*for its size*/)) {
    const auto expected = anyTracks();
    PathTracks tracks;
    PathTracks reserved;
    for (const PathTrack& track : expected) {
        tracks.push_back(track);
        reserved.reserveFor(track.size());
        reserved.push_back(track);
    }
    RC_ASSERT(tracks == reserved);
    RC_ASSERT(tracks.size() == expected.size());
    RC_ASSERT(tracks.empty() == expected.empty());
    for (std::size_t i = 0; i < expected.size(); ++i)
        RC_ASSERT(tracks[i] == expected[i]);
    for (std::size_t i = 0; i < expected.size(); ++i)
        if (!expected[i].empty())
            RC_ASSERT(tracks.lastOf(i) == expected[i].back());
    if (!expected.empty()) {
        RC_ASSERT(tracks[0] == expected.front());
        RC_ASSERT(tracks[tracks.size() - 1] == expected.back());
    }
    std::vector<PathTrack> visited;
    tracks.forEach(
        [&visited](const PathTrack& track) { visited.push_back(track); });
    RC_ASSERT(visited == expected);

    PathTracks copy = tracks;
    copy.shrinkToFit();
    RC_ASSERT(copy == tracks);
    RC_ASSERT(copy.memoryBytes() <= tracks.memoryBytes());
    copy.push_back({1});
    RC_ASSERT(!(copy == tracks));
    RC_ASSERT(copy[copy.size() - 1] == PathTrack{1});
}

// All but the first of 16 say only how they differ.
TEST(PathTracks, TheSameFoldersTakeLittle) {
    PathTracks tracks;
    for (unsigned i = 0; i < 10000; ++i) {
        PathTrack track(30, 7);
        track.push_back(i % 128);
        tracks.push_back(track);
    }
    tracks.shrinkToFit();
    EXPECT_LE(tracks.memoryBytes(), 10000U * 6);
    PathTrack last(30, 7);
    last.push_back(9999 % 128);
    EXPECT_EQ(tracks[9999], last);
}

TEST(PathTracks, ATrackTakesAboutAByteAPosition) {
    PathTracks tracks;
    for (unsigned i = 0; i < 10000; ++i) tracks.push_back({1, i % 100, 3, 4});
    tracks.shrinkToFit();
    EXPECT_LE(tracks.memoryBytes(), 10000U * 6);
    EXPECT_EQ(tracks[9999], (PathTrack{1, 99, 3, 4}));
}

}  // namespace
