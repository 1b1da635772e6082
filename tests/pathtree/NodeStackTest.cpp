// The stack of nodes, beside a standard stack.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <stack>

#include "pathtree/BPathTree.hpp"
#include "pathtree/NodeStack.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNode;
using tessel::BNodePtr;
using tessel::BPathTree;

RC_GTEST_PROP(NodeStack, EqualsAStandardStack, ()) {
    BPathTree tree;
    for (std::size_t i = 0; i < 5; ++i) {
        const std::vector<std::string> files(i, "f");
        support::addBatch(tree, {support::numbered("folder", i)}, files);
    }
    std::vector<BNodePtr> nodes = {tree.root};
    for (std::size_t i = 0; i < 5; ++i)
        nodes.emplace_back(tree.root->children()[i]);
    tessel::NodeStack actual;
    std::stack<BNode> expected;
    const auto steps =
        *rc::gen::container<std::vector<unsigned>>(rc::gen::inRange(0U, 18U));
    for (const unsigned step : steps) {
        const BNodePtr& node = nodes[step % 6];
        if (step < 6) {
            actual.push(node);
            expected.push(*node);
        } else if (step < 12) {
            const tessel::ChildList children = node->children();
            actual.pushChildren(node);
            for (std::size_t i = children.size(); i-- > 0;)
                expected.push(children[i]);
        } else if (!expected.empty()) {
            actual.pop();
            expected.pop();
        }
        RC_ASSERT(actual.size() == expected.size());
        RC_ASSERT(actual.empty() == expected.empty());
        if (!expected.empty()) RC_ASSERT(actual.top() == expected.top());
    }
    tessel::NodeStack copy = actual;
    actual.clear();
    RC_ASSERT(actual.empty());
    while (!expected.empty()) {
        RC_ASSERT(copy.top() == expected.top());
        copy.pop();
        expected.pop();
    }
    RC_ASSERT(copy.empty());
}

TEST(NodeStack, ChildrenAppendedLaterAreNotOnTheStack) {
    BPathTree tree;
    support::addBatch(tree, {}, {"a", "b"});
    tessel::NodeStack stack;
    stack.pushChildren(tree.root);
    support::addBatch(tree, {}, {"c"});
    EXPECT_EQ(stack.size(), 2U);
    EXPECT_EQ(support::textOf(stack.top().value()), "a");
    stack.pop();
    EXPECT_EQ(support::textOf(stack.top().value()), "b");
    stack.pop();
    EXPECT_TRUE(stack.empty());
    stack.pushChildren(tree.root);
    EXPECT_EQ(stack.size(), 3U);
}

TEST(NodeStack, PushesAfterAReserveTakeNoMemory) {
    BPathTree tree;
    support::addBatch(tree, {}, {"a"});
    tessel::NodeStack stack;
    EXPECT_EQ(stack.memoryBytes(), 0U);
    for (std::size_t i = 0; i < 100; ++i) {
        stack.reserve(1);
        const std::size_t bytes = stack.memoryBytes();
        stack.push(tree.root);
        EXPECT_EQ(stack.memoryBytes(), bytes);
        EXPECT_LE(bytes, (i + 2) * 48);
    }
}

TEST(NodeStack, KeepsItsNodesAlive) {
    tessel::NodeStack stack;
    {
        BPathTree tree;
        support::addBatch(tree, {"a"}, {"f", "g"});
        stack.push(BNodePtr(tree.root->children()[0]));
        stack.pushChildren(BNodePtr(tree.root->children()[0]));
    }
    EXPECT_EQ(support::textOf(stack.top().value()), "f");
    stack.pop();
    EXPECT_EQ(support::textOf(stack.top().value()), "g");
    stack.pop();
    EXPECT_EQ(support::childTexts(stack.top()),
              (std::vector<std::string>{"f", "g"}));
}

}  // namespace
