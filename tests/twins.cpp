// Every fast route of the library beside the plain one that it must equal.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <map>

#include "coder/FolderCache.hpp"
#include "coder/PathTracks.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::Bytes;
using tessel::BNode;
using tessel::BPathTree;
using tessel::Component;
using tessel::ComponentPacker;
using tessel::Components;
using tessel::PathTrack;
using tessel::PathTracks;

// ---- Path tracks: a list of lists ----

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

RC_GTEST_PROP(PathTracks, EqualAListOfLists,
              (const std::vector<int>& /*for its size*/)) {
    const auto expected =
        *rc::gen::container<std::vector<PathTrack>>(anyTrack());
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
    if (!expected.empty()) {
        RC_ASSERT(tracks.front() == expected.front());
        RC_ASSERT(tracks.back() == expected.back());
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
    RC_ASSERT(copy.back() == PathTrack{1});
}

TEST(PathTracks, ATrackTakesAboutAByteAPosition) {
    PathTracks tracks;
    for (unsigned i = 0; i < 10000; ++i) tracks.push_back({1, i % 100, 3, 4});
    tracks.shrinkToFit();
    EXPECT_LE(tracks.memoryBytes(), 10000U * 6);
    EXPECT_EQ(tracks[9999], (PathTrack{1, 99, 3, 4}));
}

// ---- The cache of folders: a map ----

RC_GTEST_PROP(FolderCache, EqualsAMap, ()) {
    const auto component =
        rc::gen::container<Component>(1, rc::gen::inRange<std::uint8_t>(0, 6));
    const auto folders = *rc::gen::scale(
        5, rc::gen::container<std::vector<Components>>(rc::gen::scale(
               0.01, rc::gen::container<Components>(component))));
    BPathTree tree;
    tessel::FolderCache cache;
    ComponentPacker packer;
    std::map<Components, std::pair<BNode*, PathTrack>> expected;
    for (const Components& components : folders) {
        const auto list = support::packedBy(packer, components);
        const auto hash = tessel::FolderCache::hashOf(list);
        const auto known = expected.find(components);
        const tessel::FolderCache::Folder* found = cache.find(list, hash);
        RC_ASSERT((found != nullptr) == (known != expected.end()));
        if (found != nullptr) {
            const auto track = cache.trackOf(*found);
            RC_ASSERT(found->node == known->second.first);
            RC_ASSERT(PathTrack(track.begin(), track.end()) ==
                      known->second.second);
            continue;
        }
        PathTrack track;
        BNode& node = tree.addBatch(list, {}, track).folder;
        cache.add(list, hash, node, track);
        expected[components] = {&node, track};
    }
}

TEST(FolderCache, FoldersOfEqualHashAreToldApart) {
    constexpr std::size_t count = 400000;
    tessel::FolderCache cache;
    ComponentPacker packer;
    BPathTree tree;
    for (std::size_t i = 0; i < count; ++i) {
        const auto list =
            support::packedBy(packer, {support::littleEndian(i, 4)});
        const auto hash = tessel::FolderCache::hashOf(list);
        ASSERT_EQ(cache.find(list, hash), nullptr) << i;
        cache.add(list, hash, *tree.root, {i});
    }
}

// ---- Lookup by number: a merge, step by step ----

// A coder with one folder of many files, and partitions that end anywhere.
struct Crafted {
    model::Coder expected;
    support::CoderPtr coder = std::make_unique<tessel::HuffmanPathTree>();
};

Crafted crafted(const std::vector<std::uint64_t>& ends) {
    Crafted both;
    both.expected.code = model::buildCode(u"ab", {1, 1});
    model::Path files;
    for (unsigned i = 0; i < 60; ++i)
        files.push_back({static_cast<std::uint8_t>(i), 0});
    both.expected.addPartition({{1, 1}}, files);
    for (unsigned i = 0; i < 10; ++i) {
        const auto name = static_cast<std::uint8_t>(i);
        both.expected.addPartition({{1, 1}, {name, 3}}, {{2, 2}});
    }
    both.expected.partitionEnds = ends;
    both.expected.partitionTracks.clear();
    for (std::size_t k = 0; k < ends.size(); ++k) {
        const model::Track tracks[] = {{0}, {0, 60 + k % 10}, {0, k % 60}, {}};
        both.expected.partitionTracks.push_back(tracks[k % 4]);
    }
    Bytes form = both.expected.form().bytes();
    both.coder->deserialize(form, false);
    both.expected = both.expected.restored();
    return both;
}

void compareLookup(const Crafted& both, const std::vector<double>& numbers) {
    const auto expected = both.expected.getPath(numbers);
    const auto answer = support::found(*both.coder, numbers);
    RC_ASSERT(answer.has_value() == expected.has_value());
    if (!expected) return;
    RC_ASSERT(answer->folders == expected->folders);
    RC_ASSERT(answer->files == expected->files);
}

RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeWhereverPartitionsEnd, ()) {
    const auto ends =
        *rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100)));
    const Crafted both = crafted(ends);
    const auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(0, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
    std::vector<double> sorted = numbers;
    std::sort(sorted.begin(), sorted.end());
    compareLookup(both, sorted);
    sorted.erase(std::remove(sorted.begin(), sorted.end(), 0), sorted.end());
    compareLookup(both, sorted);

    // A copy, and the coder after one more batch, keep the ends' order.
    Crafted copied;
    copied.expected = both.expected;
    copied.coder->copyTree(*both.coder);
    compareLookup(copied, sorted);
    Components folder = {{1, 1}};
    Components files = {{5, 5}};
    copied.expected.addPartition(folder, files);
    copied.coder->addPathToBTree(folder, files);
    compareLookup(copied, sorted);
    compareLookup(copied, numbers);
}

// Two forms read one after the other: the ends begin again.
RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeAfterASecondForm, ()) {
    const auto ends = rc::gen::map(
        rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100))),
        [](std::vector<std::uint64_t> list) {
            std::sort(list.begin(), list.end());
            return list;
        });
    Crafted both = crafted(*ends);
    const Crafted second = crafted(*ends);
    Bytes form = second.expected.form().bytes();
    both.coder->deserialize(form, false);
    for (const std::uint64_t end : second.expected.partitionEnds)
        both.expected.partitionEnds.push_back(end);
    for (const model::Track& track : second.expected.partitionTracks)
        both.expected.partitionTracks.push_back(track);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(1, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
}

RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeInManyPartitions, ()) {
    const auto sizes = *rc::gen::scale(
        10, rc::gen::nonEmpty(rc::gen::container<std::vector<unsigned>>(
                rc::gen::inRange(0U, 4U))));
    std::vector<std::uint64_t> ends;
    std::uint64_t end = 0;
    for (const unsigned size : sizes) ends.push_back(end += size);
    const Crafted both = crafted(ends);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange<std::uint64_t>(1, end + 3),
                     [](std::uint64_t n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
}

}  // namespace
