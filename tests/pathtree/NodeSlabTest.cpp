// The slabs that nodes are allocated in.

#include <gtest/gtest.h>

#include <thread>

#include "pathtree/BPathTree.hpp"
#include "pathtree/NodeSlab.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BPathTree;
using tessel::FolderNode;
using tessel::NodeSlab;
using Paths = std::vector<std::string>;

TEST(NodeSlab, AllocatesFrontToBackUntilItIsFull) {
    NodeSlab* slab = NodeSlab::create(1000);
    std::uintptr_t last = reinterpret_cast<std::uintptr_t>(slab);
    std::size_t count = 0;
    while (void* at = slab->allocate(13)) {
        const auto address = reinterpret_cast<std::uintptr_t>(at);
        EXPECT_EQ(address % NodeSlab::nodeAlignment, 0U);
        EXPECT_GT(address, last);
        EXPECT_EQ(NodeSlab::of(static_cast<FolderNode*>(at)), slab);
        last = address;
        ++count;
    }
    EXPECT_EQ(count, (1000 - sizeof(NodeSlab)) / 16);
    for (std::size_t i = 0; i <= count; ++i) slab->release();
}

// A tree that was loaded anew shares no node with its former copy, but its
// new nodes may be in a slab that also has old ones. Files of both become
// folders at the same time, and both are released at the same time.
TEST(NodeSlab, TreesThatShareNothingChangeOnTwoThreads) {
    constexpr std::size_t files = 40;
    Paths names;
    for (std::size_t i = 0; i < files; ++i)
        names.push_back(support::numbered("f", i));
    const auto extend = [&names](BPathTree& tree) {
        for (const std::string& name : names)
            support::addWhole(tree, {name, "child"});
    };
    for (int round = 0; round < 200; ++round) {
        auto loaded = std::make_unique<BPathTree>();
        support::addBatch(*loaded, {}, names);
        auto copy = std::make_unique<BPathTree>(*loaded);
        std::vector<std::uint8_t> structure;
        tessel::Components values;
        loaded->serialize(structure, values);
        loaded->deserialize(structure, values);
        ASSERT_FALSE(loaded->root == copy->root);
        std::thread extender([&] { extend(*copy); });
        extend(*loaded);
        extender.join();
        for (const auto* tree : {&loaded, &copy})
            for (std::size_t i = 0; i < files; ++i)
                ASSERT_EQ(support::childTexts((*tree)->root->children()[i]),
                          Paths{"child"});
        std::thread releaser([&] { copy.reset(); });
        loaded.reset();
        releaser.join();
    }
}

}  // namespace
