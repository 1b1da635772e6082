// Packed lists of components, beside lists of byte vectors.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>

#include "pathtree/BPathTree.hpp"
#include "pathtree/ComponentArena.hpp"
#include "pathtree/TreeInserter.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BPathTree;
using tessel::Component;
using tessel::ComponentArena;
using tessel::ComponentList;
using tessel::Components;
using tessel::PathTrack;

rc::Gen<Component> anyComponent() {
    return rc::gen::weightedOneOf<Component>(
        {{10, rc::gen::container<Component>(support::anyByte())},
         {1, rc::gen::map(
                 rc::gen::element<std::size_t>(253, 254, 255, 256, 1000, 70000),
                 [](std::size_t length) { return Component(length, 0x5A); })}});
}

Components unpacked(const ComponentList& list) {
    Components components;
    for (const tessel::ComponentView value : list)
        components.emplace_back(value.begin(), value.end());
    return components;
}

RC_GTEST_PROP(ComponentArena, EqualListsOfComponents, ()) {
    const auto expected = *rc::gen::container<std::vector<Components>>(
        rc::gen::scale(0.2, rc::gen::container<Components>(anyComponent())));
    ComponentArena arena;
    std::vector<ComponentList> lists;
    for (const Components& components : expected)
        lists.push_back(support::packedBy(arena, components));
    const auto buffers = arena.takeBuffers();
    for (std::size_t i = 0; i < expected.size(); ++i) {
        RC_ASSERT(lists[i].size() == expected[i].size());
        RC_ASSERT(lists[i].empty() == expected[i].empty());
        RC_ASSERT(unpacked(lists[i]) == expected[i]);
        for (std::size_t k = 0; k < i; ++k)
            RC_ASSERT(
                tessel::sameComponent(lists[i].bytes(), lists[k].bytes()) ==
                (expected[i] == expected[k]));
    }
}

TEST(ComponentArena, AArenaIsAsNewAfterItsBuffersWereTaken) {
    ComponentArena arena;
    const auto first = support::packedBy(arena, {{1, 2}, {3}});
    const auto firstBuffers = arena.takeBuffers();
    const auto second = support::packedBy(arena, {{4}});
    EXPECT_EQ(unpacked(first), (Components{{1, 2}, {3}}));
    EXPECT_EQ(unpacked(second), (Components{{4}}));
    EXPECT_EQ(second.size(), 1U);
}

TEST(ComponentArena, TheSlackAfterAComponentMayBeWritten) {
    ComponentArena arena;
    for (std::size_t length = 0; length < 3000; ++length) {
        std::uint8_t* to = arena.extend(length);
        std::fill_n(to, length + ComponentArena::slack,
                    static_cast<std::uint8_t>(length));
    }
    const ComponentList list = arena.finish();
    std::size_t length = 0;
    for (const tessel::ComponentView value : list) {
        ASSERT_EQ(value.size(), length);
        for (const std::uint8_t byte : value)
            ASSERT_EQ(byte, static_cast<std::uint8_t>(length));
        ++length;
    }
    EXPECT_EQ(length, 3000U);
}

TEST(ComponentArena, WhatIsCommittedIsTheListWhateverWasReserved) {
    ComponentArena arena;
    Components expected;
    for (std::size_t length = 0; length < 600; ++length) {
        const std::size_t most = length + 3 * (length % 100);
        std::fill_n(arena.reserve(most), most + ComponentArena::slack,
                    std::uint8_t{0xAA});  // dropped
        const auto byte = static_cast<std::uint8_t>(length);
        std::uint8_t* const to = arena.reserve(most);
        std::fill_n(to, length, byte);
        std::fill_n(to + length, most - length + ComponentArena::slack,
                    std::uint8_t{0xBB});
        arena.commit(length);
        expected.emplace_back(length, byte);
        if (length % 7 == 0) {
            arena.append(expected.front());
            expected.push_back(expected.front());
        }
    }
    EXPECT_EQ(unpacked(arena.finish()), expected);
}

// A batch that is inserted packed equals one that is inserted unpacked.
RC_GTEST_PROP(ComponentArena, InsertionEqualsThatOfVectors, ()) {
    const auto component =
        rc::gen::container<Component>(1, rc::gen::inRange<std::uint8_t>(0, 4));
    const auto batches =
        *rc::gen::container<std::vector<std::pair<Components, Components>>>(
            rc::gen::scale(
                0.1, rc::gen::pair(rc::gen::container<Components>(component),
                                   rc::gen::container<Components>(component))));
    BPathTree plain;
    BPathTree packed;
    for (const auto& [folder, files] : batches) {
        Components folderVectors = folder;
        Components fileVectors = files;
        PathTrack plainTrack;
        std::uint64_t first = 0;
        const bool plainExisted =
            plain.addPath(folderVectors, fileVectors, plainTrack, first);
        ComponentArena arena;
        const auto folderList = support::packedBy(arena, folder);
        const auto fileList = support::packedBy(arena, files);
        PathTrack packedTrack;
        const tessel::TreeInserter::AddedBatch added =
            packed.inserter().addBatch(*packed.root, folderList, fileList,
                                       packedTrack);
        RC_ASSERT(added.existed == plainExisted);
        RC_ASSERT(packedTrack == plainTrack);
        if (plainExisted) RC_ASSERT(added.firstFile == first);
    }
    RC_ASSERT(support::storedTree(packed) == support::storedTree(plain));
}

}  // namespace
