// The pass over all nodes of a tree.

#include <gtest/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "pathtree/NodeWalk.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using tessel::BPathTree;
using tessel::NodeWalk;
using Texts = std::vector<std::string>;

// "1 name leaf last": what the walk tells of each node.
Texts walked(const BPathTree& tree) {
    Texts seen;
    for (NodeWalk walk(*tree.root); walk.next();) {
        std::string line = std::to_string(walk.depth());
        line.append(" ").append(support::textOf(walk.node().value()));
        if (walk.isLeaf()) line += " leaf";
        if (walk.isLastChild()) line += " last";
        seen.push_back(line);
    }
    return seen;
}

TEST(NodeWalk, AnEmptyTreeHasNothingToWalk) {
    const BPathTree tree;
    EXPECT_EQ(walked(tree), Texts{});
    NodeWalk walk(*tree.root);
    EXPECT_FALSE(walk.next());
    EXPECT_FALSE(walk.next());
}

TEST(NodeWalk, ParentsComeBeforeTheirChildrenInOrder) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"f", "g"});
    addBatch(tree, {"a"}, {"h"});
    addBatch(tree, {"c"}, {});
    EXPECT_EQ(walked(tree), (Texts{"0 a", "1 b", "2 f leaf", "2 g leaf last",
                                   "1 h leaf last", "0 c leaf last"}));
}

}  // namespace
