// The slabs that nodes are allocated in.

#include <gtest/gtest.h>

#include <thread>

#include "pathtree/BPathTree.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/NodeSlab.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNode;
using tessel::BPathTree;
using tessel::ChildStore;
using tessel::NodeSlab;
using Paths = std::vector<std::string>;

TEST(NodeSlab, AllocatesFrontToBackUntilItIsFull) {
    NodeSlab* slab = NodeSlab::create(1000);
    std::uintptr_t last = reinterpret_cast<std::uintptr_t>(slab);
    std::size_t count = 0;
    while (void* at = slab->allocate(8, 5)) {
        const auto address = reinterpret_cast<std::uintptr_t>(at);
        EXPECT_EQ(address % NodeSlab::nodeAlignment, 0U);
        EXPECT_GT(address, last);
        EXPECT_EQ(NodeSlab::of(static_cast<BNode*>(at)), slab);
        last = address;
        ++count;
    }
    EXPECT_EQ(count, (1000 - sizeof(NodeSlab)) / 16);
    for (std::size_t i = 0; i <= count; ++i) slab->release();
}

TEST(NodeSlab, KeepsStoresOfSeveralNodes) {
    NodeSlab* slab = NodeSlab::create(1000);
    const auto* a = static_cast<BNode*>(slab->allocate(0, 5));
    const auto* b = static_cast<BNode*>(slab->allocate(0, 5));
    const std::size_t before = slab->memoryBytes();
    auto* child = reinterpret_cast<BNode*>(std::uintptr_t{64});
    slab->setChildStore(a, ChildStore::only(child));
    slab->setChildStore(b, ChildStore());
    EXPECT_EQ(slab->childStore(a).child(), child);
    EXPECT_EQ(slab->childStore(b).size(), 0U);
    slab->setChildStore(a, ChildStore());
    EXPECT_EQ(slab->childStore(a).size(), 0U);
    EXPECT_GT(slab->memoryBytes(), before + 2 * 32);
    slab->forgetChildStore(a);
    slab->forgetChildStore(b);
    for (int i = 0; i < 3; ++i) slab->release();
}

TEST(NodeSlab, ForgetsTheStoreOfANodeThatIsReleased) {
    tessel::NodePool pool;
    const auto leaf = [&pool] {
        return tessel::BNodePtr::adopt(
            pool.make({}, tessel::NodePool::Kind::leaf));
    };
    const tessel::BNodePtr keeper = leaf();
    NodeSlab* slab = NodeSlab::of(keeper.get());
    tessel::BNodePtr late = leaf();
    ASSERT_EQ(NodeSlab::of(late.get()), slab);
    pool.add(*late, {}, tessel::NodePool::Kind::leaf);
    const std::size_t before = slab->memoryBytes();
    late = {};
    EXPECT_EQ(slab->memoryBytes(), before - 32);
}

// A tree that was loaded anew shares no node with its former copy, but its
// new nodes may be in a slab that also has old ones. Files of both become
// folders at the same time.
TEST(NodeSlab, TreesThatShareNothingGetStoresOnTwoThreads) {
    constexpr std::size_t files = 40;
    Paths names;
    for (std::size_t i = 0; i < files; ++i)
        names.push_back(support::numbered("f", i));
    const auto extend = [&names](BPathTree& tree) {
        for (const std::string& name : names)
            support::addWhole(tree, {name, "child"});
    };
    for (int round = 0; round < 200; ++round) {
        BPathTree loaded;
        support::addBatch(loaded, {}, names);
        BPathTree copy(loaded);
        std::vector<std::uint8_t> structure;
        tessel::Components values;
        loaded.serialize(structure, values);
        loaded.deserialize(structure, values);
        ASSERT_NE(loaded.root, copy.root);
        std::thread other([&] { extend(copy); });
        extend(loaded);
        other.join();
        for (BPathTree* tree : {&loaded, &copy})
            for (std::size_t i = 0; i < files; ++i)
                ASSERT_EQ(support::childTexts(tree->root->children()[i]),
                          Paths{"child"});
    }
}

}  // namespace
