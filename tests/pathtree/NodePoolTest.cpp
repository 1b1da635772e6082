// Making nodes, growing their lists and taking children away again.

#include <gtest/gtest.h>

#include <limits>
#include <stdexcept>

#include "pathtree/NodePool.hpp"
#include "pathtree/NodeSlab.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::childTexts;
using support::component;
using tessel::BNode;
using tessel::BNodePtr;
using tessel::NodePool;
using tessel::NodeSlab;
using Kind = NodePool::Kind;
using Texts = std::vector<std::string>;

BNodePtr folder(NodePool& pool) {
    return BNodePtr::adopt(pool.make({}, Kind::folder));
}

TEST(NodePool, ANodeTakesItsValueAndAFewBytes) {
    NodePool pool;
    const BNodePtr first = BNodePtr::adopt(pool.make({}, Kind::leaf));
    const auto distance = [&](std::size_t length, Kind kind) {
        const BNodePtr before = BNodePtr::adopt(pool.make({}, Kind::leaf));
        const BNodePtr node =
            BNodePtr::adopt(pool.make(tessel::Component(length, 1), kind));
        const BNodePtr after = BNodePtr::adopt(pool.make({}, Kind::leaf));
        return reinterpret_cast<std::uintptr_t>(after.get()) -
               reinterpret_cast<std::uintptr_t>(before.get()) - 8;
    };
    EXPECT_EQ(distance(0, Kind::leaf), 8U);
    EXPECT_EQ(distance(3, Kind::leaf), 8U);
    EXPECT_EQ(distance(4, Kind::leaf), 12U);
    EXPECT_EQ(distance(62, Kind::leaf), 68U);
    EXPECT_EQ(distance(63, Kind::leaf), 76U);
    EXPECT_EQ(distance(3, Kind::folder), 16U);
    EXPECT_EQ(distance(50000, Kind::leaf), 24U);
}

TEST(NodePool, SlabsGrowWithWhatWasMade) {
    NodePool pool;
    const BNodePtr first = folder(pool);
    EXPECT_LE(NodeSlab::of(first.get())->memoryBytes(), 1024U);
    std::vector<BNodePtr> nodes;
    for (int i = 0; i < 30000; ++i)
        nodes.push_back(BNodePtr::adopt(pool.make({}, Kind::leaf)));
    const std::size_t last = NodeSlab::of(nodes.back().get())->memoryBytes();
    EXPECT_GT(last, 15U << 10);
    EXPECT_LE(last, 16U << 10);
}

TEST(NodePool, NodesOutliveTheirPool) {
    BNodePtr node;
    {
        NodePool pool;
        node = folder(pool);
        pool.add(*node, component("a"), Kind::leaf);
    }
    EXPECT_EQ(childTexts(*node), Texts{"a"});
}

TEST(NodePool, AFirstListIsExactAndALaterOneHasAQuarterMore) {
    NodePool pool;
    const auto bytesOf = [](std::size_t children) {
        return 8 + children * sizeof(void*);
    };
    const BNodePtr node = folder(pool);
    NodePool::reserve(*node, 1000);
    EXPECT_GE(node->childListBytes(), bytesOf(1000));
    EXPECT_LE(node->childListBytes(), bytesOf(1000) + 32);
    for (int i = 0; i < 1000; ++i) pool.add(*node, {}, Kind::leaf);
    EXPECT_LE(node->childListBytes(), bytesOf(1000) + 32);
    pool.add(*node, {}, Kind::leaf);
    EXPECT_GE(node->childListBytes(), bytesOf(1250));
    EXPECT_LE(node->childListBytes(), bytesOf(1251) + 32);
    NodePool::reserve(*node, 5000);
    EXPECT_LE(node->childListBytes(), bytesOf(6001) + 32);
}

TEST(NodePool, AnOnlyChildThatWasReservedForTakesNoList) {
    NodePool pool;
    const BNodePtr node = folder(pool);
    NodePool::reserve(*node, 0);
    NodePool::reserve(*node, 1);
    EXPECT_EQ(node->childListBytes(), 0U);
}

TEST(NodePool, TooManyChildrenAreRefusedBeforeMemoryIsTaken) {
    NodePool pool;
    const BNodePtr node = folder(pool);
    pool.add(*node, component("a"), Kind::leaf);
    constexpr std::size_t most = std::numeric_limits<std::uint32_t>::max();
    EXPECT_THROW(NodePool::reserve(*node, most), std::length_error);
    EXPECT_THROW(NodePool::reserve(*node, ~std::size_t{0}), std::length_error);
    EXPECT_EQ(childTexts(*node), Texts{"a"});
}

TEST(NodePool, TruncateReleasesTheLastChildren) {
    for (const Kind kind : {Kind::leaf, Kind::folder}) {
        NodePool pool;
        const BNodePtr node = BNodePtr::adopt(pool.make({}, kind));
        NodePool::truncate(*node, 0);
        pool.add(*node, component("a"), Kind::leaf);
        const BNodePtr held(&pool.add(*node, component("b"), Kind::leaf));
        pool.add(*node, component("c"), Kind::leaf);
        NodePool::truncate(*node, 3);
        EXPECT_EQ(node->children().size(), 3U);
        NodePool::truncate(*node, 1);
        EXPECT_EQ(childTexts(*node), Texts{"a"});
        EXPECT_EQ(support::textOf(held->value()), "b");
        NodePool::truncate(*node, 0);
        EXPECT_TRUE(node->isLeaf());
        pool.add(*node, component("d"), Kind::leaf);
        EXPECT_EQ(childTexts(*node), Texts{"d"});
    }
}

}  // namespace
