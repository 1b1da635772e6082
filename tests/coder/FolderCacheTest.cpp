// The cache of folders beside a map.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <map>

#include "coder/FolderCache.hpp"
#include "pathtree/TreeInserter.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNode;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::Component;
using tessel::ComponentArena;
using tessel::Components;
using tessel::PathTrack;

RC_GTEST_PROP(FolderCache, EqualsAMap, ()) {
    const auto component =
        rc::gen::container<Component>(1, rc::gen::inRange<std::uint8_t>(0, 6));
    const auto folders = *rc::gen::scale(
        5, rc::gen::container<std::vector<Components>>(rc::gen::scale(
               0.01, rc::gen::container<Components>(component))));
    BPathTree tree;
    tessel::FolderCache cache;
    ComponentArena packer;
    std::map<Components, std::pair<BNodePtr, PathTrack>> expected;
    for (const Components& components : folders) {
        const auto list = support::packedBy(packer, components);
        const auto hash = tessel::FolderCache::hashOf(list);
        const auto known = expected.find(components);
        const tessel::FolderCache::Folder* found = cache.find(list, hash);
        RC_ASSERT((found != nullptr) == (known != expected.end()));
        if (found != nullptr) {
            const auto track = cache.trackOf(*found);
            RC_ASSERT(found->node == *known->second.first);
            RC_ASSERT(PathTrack(track.begin(), track.end()) ==
                      known->second.second);
            continue;
        }
        PathTrack track;
        const BNode node =
            tree.inserter().addBatch(*tree.root, list, {}, track).folder;
        cache.add(list, hash, node, track);
        expected[components] = {BNodePtr(node), track};
    }
}

TEST(FolderCache, AFolderAboveHasTheBeginningOfTheTrack) {
    BPathTree tree;
    ComponentArena packer;
    tessel::FolderCache cache;
    const auto deep = support::packedBy(packer, {{1}, {2, 2}, {3}});
    PathTrack track;
    const BNode node =
        tree.inserter().addBatch(*tree.root, deep, {}, track).folder;
    cache.reserveFor(3, 1);
    cache.add(deep, tessel::FolderCache::hashOf(deep), node, {7, 8, 9});
    const auto above = support::packedBy(packer, {{1}, {2, 2}});
    const auto hash = tessel::FolderCache::hashOf(above);
    EXPECT_EQ(cache.find(above, hash), nullptr);
    cache.addAbove(above, hash, *tree.root);
    const tessel::FolderCache::Folder* found = cache.find(above, hash);
    ASSERT_NE(found, nullptr);
    EXPECT_EQ(found->node, *tree.root);
    const auto positions = cache.trackOf(*found);
    EXPECT_EQ(PathTrack(positions.begin(), positions.end()), (PathTrack{7, 8}));
}

TEST(FolderCache, FoldersOfEqualHashAreToldApart) {
    constexpr std::size_t count = 400000;
    tessel::FolderCache cache;
    ComponentArena packer;
    BPathTree tree;
    for (std::size_t i = 0; i < count; ++i) {
        const auto list =
            support::packedBy(packer, {support::littleEndian(i, 4)});
        const auto hash = tessel::FolderCache::hashOf(list);
        ASSERT_EQ(cache.find(list, hash), nullptr) << i;
        cache.add(list, hash, *tree.root, {i});
    }
}

}  // namespace
