// A node of the Huffman tree, and the order in the heap.

#include <gtest/gtest.h>

#include <limits>

#include "coder/HNode.hpp"

namespace {

using tessel::HNode;

TEST(HNode, OneWithoutChildrenIsALeaf) {
    HNode node;
    EXPECT_TRUE(node.isLeaf());
    EXPECT_EQ(node.index, -1);
    node.left = 0;
    EXPECT_FALSE(node.isLeaf());
    node.left = -1;
    node.right = 0;
    EXPECT_FALSE(node.isLeaf());
}

TEST(HNode, TheHeapComparesFrequenciesAlone) {
    const tessel::HNodeFrequencyComparator isBelow;
    HNode rare;
    HNode frequent;
    rare.frequency = 1;
    frequent.frequency = 2;
    EXPECT_TRUE(isBelow(frequent, rare));
    EXPECT_FALSE(isBelow(rare, frequent));
    HNode equal = rare;
    equal.character = u'z';
    equal.index = 7;
    EXPECT_FALSE(isBelow(rare, equal));
    EXPECT_FALSE(isBelow(equal, rare));
    equal.frequency = std::numeric_limits<double>::quiet_NaN();
    EXPECT_FALSE(isBelow(equal, rare));
    EXPECT_FALSE(isBelow(rare, equal));
}

}  // namespace
