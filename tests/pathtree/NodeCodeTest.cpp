// The codes of the stored path tree.

#include <gtest/gtest.h>

#include <vector>

#include "pathtree/NodeCode.hpp"
#include "tests/support/Trees.hpp"

namespace {

TEST(NodeCode, SaysWhetherChildrenAndSiblingsFollow) {
    tessel::BPathTree tree;
    support::addBatch(tree, {"folder that is not last"}, {"f", "g"});
    support::addBatch(tree, {"folder that is last"}, {"h"});
    std::vector<unsigned> codes;
    for (tessel::NodeWalk walk(*tree.root); walk.next();)
        codes.push_back(tessel::nodecode::of(walk));
    EXPECT_EQ(codes, (std::vector<unsigned>{3, 2, 0, 1, 0}));
    EXPECT_EQ(tessel::nodecode::maxCode, 3U);
}

}  // namespace
