// Making nodes in slabs.

#include <gtest/gtest.h>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/NodeSlab.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::childTexts;
using tessel::BNodePtr;
using tessel::NodePool;
using tessel::NodeSlab;

BNodePtr empty(NodePool& pool) { return BNodePtr::adopt(pool.make({}, {})); }

TEST(NodePool, ANodeTakesItsNameItsChildrenAndAFewBytes) {
    tessel::ComponentArena arena;
    const auto distance = [&](std::size_t length, std::size_t files) {
        NodePool pool;  // all in its first slab
        const auto list = support::packedBy(
            arena, tessel::Components(files, support::component("12345")));
        const BNodePtr before = empty(pool);
        const BNodePtr node = BNodePtr::adopt(pool.make(
            tessel::Component(length, 1), {list.bytes(), list.size(), false}));
        const BNodePtr after = empty(pool);
        return reinterpret_cast<std::uintptr_t>(after->folder()) -
               reinterpret_cast<std::uintptr_t>(before->folder()) - 20;
    };
    EXPECT_EQ(distance(0, 0), 20U);  // 9, and the way to children: 8
    EXPECT_EQ(distance(3, 0), 20U);
    EXPECT_EQ(distance(4, 0), 24U);
    EXPECT_EQ(distance(62, 0), 80U);
    EXPECT_EQ(distance(63, 0), 88U);
    EXPECT_EQ(distance(50000, 0), 36U);
    EXPECT_EQ(distance(3, 1), 24U);  // 9 + 3, a header of 4, an entry of 6
    EXPECT_EQ(distance(3, 2), 28U);
    EXPECT_EQ(distance(3, 29), 196U);  // three samples of 1, too
    EXPECT_EQ(distance(3, 30), 200U);
    EXPECT_EQ(distance(3, 31), 20U);  // more than fits: on the heap
}

TEST(NodePool, SlabsGrowWithWhatWasMade) {
    NodePool pool;
    const BNodePtr first = empty(pool);
    EXPECT_LE(NodeSlab::of(first->folder())->memoryBytes(), 1024U);
    std::vector<BNodePtr> nodes;
    for (int i = 0; i < 30000; ++i) nodes.push_back(empty(pool));
    const std::size_t last =
        NodeSlab::of(nodes.back()->folder())->memoryBytes();
    EXPECT_GT(last, 15U << 10);
    EXPECT_LE(last, 16U << 10);
}

TEST(NodePool, NodesOutliveTheirPool) {
    BNodePtr node;
    {
        NodePool pool;
        tessel::ComponentArena arena;
        const auto files = support::packedBy(arena, support::components({"a"}));
        node = BNodePtr::adopt(
            pool.make(support::component("d"), {files.bytes(), 1, false}));
    }
    EXPECT_EQ(childTexts(*node), std::vector<std::string>{"a"});
    EXPECT_EQ(support::textOf(node->value()), "d");
}

}  // namespace
