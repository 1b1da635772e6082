// Nodes as they are seen from outside: folders, and files by their position.

#include <gtest/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::childTexts;
using support::textOf;
using tessel::BNode;
using tessel::BPathTree;
using Texts = std::vector<std::string>;

TEST(BNode, ATreesNodesHaveValuesAndChildren) {
    BPathTree tree;
    EXPECT_TRUE(tree.root->isLeaf());
    EXPECT_TRUE(tree.root->value().empty());
    EXPECT_TRUE(tree.root->children().empty());
    addBatch(tree, {"a"}, {"f", ""});
    addBatch(tree, {"b"}, {});
    EXPECT_EQ(childTexts(*tree.root), (Texts{"a", "b"}));
    const BNode a = tree.root->children()[0];
    EXPECT_EQ(childTexts(a), (Texts{"f", ""}));
    EXPECT_FALSE(a.isLeaf());
    EXPECT_NE(a.folder(), nullptr);
    EXPECT_EQ(textOf(a.children().back().value()), "");
    EXPECT_TRUE(a.children().node() == a);
    const BNode b = tree.root->children()[1];
    EXPECT_TRUE(b.isLeaf());
    EXPECT_EQ(b.folder(), nullptr);
    EXPECT_TRUE(b.children().empty());
    EXPECT_TRUE(b.children().reader().atEnd());
}

TEST(BNode, EqualityIsThatOfTheNodeNotOfTheValue) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "f"});
    addBatch(tree, {"b"}, {"f", "f"});
    const BNode a = tree.root->children()[0];
    const BNode b = tree.root->children()[1];
    EXPECT_TRUE(a == tree.root->children()[0]);
    EXPECT_FALSE(a == b);
    EXPECT_FALSE(a == *tree.root);
    EXPECT_TRUE(a.children()[1] == a.children()[1]);
    EXPECT_FALSE(a.children()[0] == a.children()[1]);
    EXPECT_FALSE(a.children()[0] == b.children()[0]);
    EXPECT_FALSE(a.children()[0] == a);
}

TEST(BNode, AFilesNodeFollowsItWhenItBecomesAFolder) {
    BPathTree tree;
    addBatch(tree, {}, {"f", "a name of more than eight bytes", ""});
    for (std::size_t i = 0; i < 3; ++i) {
        const BNode file = tree.root->children()[i];
        const std::string name = textOf(file.value());
        addBatch(tree, {name}, {"x", "y"});
        EXPECT_EQ(textOf(file.value()), name);
        EXPECT_EQ(childTexts(file), (Texts{"x", "y"}));
        EXPECT_TRUE(file == tree.root->children()[i]);
    }
    EXPECT_EQ(childTexts(*tree.root),
              (Texts{"f", "a name of more than eight bytes", ""}));
}

}  // namespace
