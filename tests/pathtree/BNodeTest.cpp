// One node: its value, its children and its release.

#include <gtest/gtest.h>

#include "pathtree/BNode.hpp"
#include "pathtree/NodePool.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNode;
using tessel::BNodePtr;
using tessel::Component;
using tessel::NodePool;
using Kind = NodePool::Kind;

Component valueOf(std::size_t length) {
    Component value(length);
    for (std::size_t i = 0; i < length; ++i)
        value[i] = static_cast<std::uint8_t>(i * 7 + length);
    return value;
}

// On both sides of each border: 62 and 63, 1024 and 1025.
TEST(BNode, KeepsAValueOfAnyLength) {
    NodePool pool;
    std::vector<BNodePtr> nodes;
    const std::size_t lengths[] = {0,    1,    61,   62,    63,    64,   255,
                                   1023, 1024, 1025, 16000, 16384, 70000};
    for (const Kind kind : {Kind::leaf, Kind::folder})
        for (const std::size_t length : lengths)
            nodes.push_back(BNodePtr::adopt(pool.make(valueOf(length), kind)));
    for (std::size_t i = 0; i < nodes.size(); ++i) {
        const Component expected = valueOf(lengths[i % std::size(lengths)]);
        EXPECT_TRUE(tessel::sameComponent(nodes[i]->value(), expected)) << i;
        EXPECT_TRUE(nodes[i]->isLeaf());
        EXPECT_EQ(nodes[i]->childListBytes(), 0U);
    }
}

TEST(BNode, OnlyALongValueHasABlockOfItsOwn) {
    NodePool pool;
    const auto bytes = [&pool](std::size_t length) {
        return BNodePtr::adopt(pool.make(valueOf(length), Kind::leaf))
            ->ownValueBytes();
    };
    EXPECT_EQ(bytes(0), 0U);
    EXPECT_EQ(bytes(63), 0U);
    EXPECT_EQ(bytes(1024), 0U);
    EXPECT_GE(bytes(1025), 1025U);
    EXPECT_LE(bytes(1025), 1025U + 32);
    EXPECT_GE(bytes(100000), 100000U);
}

// None, one in the node, several in an array: in order, however the node
// was made, and with a value of any length before the children came.
TEST(BNode, KeepsItsChildrenInEachOfTheThreeWays) {
    for (const std::size_t length : {0U, 62U, 63U, 1025U})
        for (const Kind kind : {Kind::leaf, Kind::folder}) {
            NodePool pool;
            const BNodePtr node =
                BNodePtr::adopt(pool.make(valueOf(length), kind));
            for (std::size_t i = 0; i < 20; ++i) {
                const BNode& child = pool.add(*node, valueOf(i), Kind::leaf);
                const tessel::ChildList children = node->children();
                ASSERT_EQ(children.size(), i + 1);
                EXPECT_EQ(&children.back(), &child);
                EXPECT_EQ(&children.node(), node.get());
                for (std::size_t k = 0; k <= i; ++k)
                    ASSERT_EQ(children[k].value().size(), k);
                EXPECT_EQ(node->childListBytes() > 0, i > 0);
            }
            EXPECT_TRUE(tessel::sameComponent(node->value(), valueOf(length)));
        }
}

TEST(BNode, IsReleasedWithEveryKindOfChild) {
    NodePool pool;
    BNodePtr held;
    {
        const BNodePtr root = BNodePtr::adopt(pool.make({}, Kind::folder));
        for (const Kind kind : {Kind::folder, Kind::leaf})
            for (std::size_t children = 0; children < 4; ++children) {
                BNode& node = pool.add(*root, valueOf(5000), kind);
                for (std::size_t i = 0; i < children; ++i) {
                    BNode& child = pool.add(node, valueOf(2000), kind);
                    pool.add(child, valueOf(3), Kind::leaf);
                }
            }
        held = BNodePtr(&root->children()[7]);
    }
    EXPECT_EQ(held->value().size(), 5000U);
    ASSERT_EQ(held->children().size(), 3U);
    EXPECT_EQ(held->children()[2].children()[0].value().size(), 3U);
}

}  // namespace
