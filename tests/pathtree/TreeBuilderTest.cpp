// Rebuilding a tree from node codes and values.

#include <gtest/gtest.h>

#include "packing/ByteCursor.hpp"
#include "pathtree/TreeBuilder.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::component;
using tessel::BPathTree;
using tessel::TreeBuilder;
using Paths = std::vector<std::string>;
using Codes = std::vector<std::uint8_t>;

TEST(TreeBuilder, IsCompleteAfterTheLastNode) {
    BPathTree tree;
    const Codes codes = {3, 2, 0, 0};
    TreeBuilder builder(tree, codes);
    for (const char* name : {"a", "f", "g", "h"}) {
        EXPECT_FALSE(builder.complete());
        builder.add(component(name));
    }
    EXPECT_TRUE(builder.complete());
    EXPECT_EQ(builder.leaves(), 3U);
    EXPECT_EQ(support::allPaths(tree), (Paths{"a/f", "a/g", "h"}));
}

TEST(TreeBuilder, ReplacesTheTreeAndForgetsItsIndex) {
    BPathTree tree;
    for (std::size_t i = 0; i < 50; ++i)
        support::addWhole(tree, {support::numbered("d", i), "f"});
    const Codes codes = {0};
    TreeBuilder builder(tree, codes);
    EXPECT_EQ(tree.memoryUsage().childIndex, 0U);
    builder.add(component("x"));
    EXPECT_EQ(support::allPaths(tree), Paths{"x"});
}

TEST(TreeBuilder, ANodeOfAnUnknownCodeIsALeaf) {
    BPathTree tree;
    const Codes codes = {3, 4};
    {
        TreeBuilder builder(tree, codes);
        builder.add(component("a"));
        EXPECT_THROW(builder.add(component("b")),
                     tessel::UnknownNodeTypeException);
        EXPECT_EQ(builder.leaves(), 0U);
    }
    EXPECT_EQ(support::allPaths(tree), Paths{"a/b"});
}

TEST(TreeBuilder, CodesThatEndEarlyAreDamage) {
    BPathTree tree;
    const Codes codes = {2};
    TreeBuilder builder(tree, codes);
    builder.add(component("a"));
    EXPECT_FALSE(builder.complete());
    EXPECT_THROW(builder.add(component("b")), tessel::DamagedFormException);
}

TEST(TreeBuilder, ListsOfChildrenAreMadeAtTheirSize) {
    constexpr std::size_t files = 1000;
    BPathTree tree;
    Codes codes = {1};
    codes.resize(files, 2);
    codes.push_back(0);
    TreeBuilder builder(tree, codes);
    while (!builder.complete()) builder.add(component("n"));
    // A length a file, a sample every 8 files, and the header.
    const std::size_t exact = files + files / 8 * 2 + 7;
    EXPECT_GE(tree.memoryUsage().childLists, exact);
    EXPECT_LE(tree.memoryUsage().childLists, exact + 64);  // and the root's
}

// The most that a form can demand: a comb of empty names takes two bytes of
// the payload per node, a code and a length.
TEST(TreeBuilder, ACombOfEmptyNamesTakesAtMostElevenBytesPerByte) {
    constexpr std::size_t levels = 20000;
    Codes codes;
    for (std::size_t i = 0; i < levels; ++i) {
        codes.push_back(2);  // a file, and then
        codes.push_back(1);  // a folder as the last child
    }
    codes.push_back(0);
    BPathTree tree;
    TreeBuilder builder(tree, codes);
    while (!builder.complete()) builder.add({});
    const BPathTree::MemoryUsage usage = tree.memoryUsage();
    // Of each open folder: its place, its name's length and a file's.
    const std::size_t builderBytes = levels * (16 + 2);
    EXPECT_LE(usage.nodes + usage.childLists + builderBytes,
              11 * 2 * codes.size() + 1024);
}

}  // namespace
