// The stored form of a path tree: node codes and values.

#include <gtest/gtest.h>

#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::addBatch;
using support::addWhole;
using support::allPaths;
using support::Bytes;
using support::components;
using support::textsOf;
using tessel::BPathTree;
using tessel::Component;
using tessel::Components;
using tessel::DamagedFormException;
using Paths = std::vector<std::string>;

struct Stored {
    std::size_t mostChildren = 0;
    Bytes structure;
    Components values;
};

Stored stored(const BPathTree& tree) {
    Stored form;
    form.mostChildren = tree.serialize(form.structure, form.values);
    return form;
}

// Reads the form into the tree and returns the number of leaves.
std::size_t read(BPathTree& tree, Bytes structure, Components values) {
    return tree.deserialize(structure, values);
}

// Values enough for any structure of a test.
Components someValues() {
    return components({"1", "2", "3", "4", "5", "6", "7", "8"});
}

// ---- Worked examples ----

TEST(PathTreeForm, AFolderOfTwoFilesAndAFile) {
    BPathTree tree;
    addBatch(tree, {"A"}, {"a1", "a2"});
    addWhole(tree, {"B"});
    const Stored form = stored(tree);
    EXPECT_EQ(form.mostChildren, 2U);
    EXPECT_EQ(form.structure, (Bytes{0x03, 0x02, 0x00, 0x00}));
    EXPECT_EQ(textsOf(form.values), (Paths{"A", "a1", "a2", "B"}));

    BPathTree back;
    EXPECT_EQ(read(back, form.structure, form.values), 3U);
    EXPECT_EQ(allPaths(back), (Paths{"A/a1", "A/a2", "B"}));
}

TEST(PathTreeForm, ASinglePathOfThreeComponents) {
    BPathTree tree;
    addWhole(tree, {"x", "y", "z"});
    const Stored form = stored(tree);
    EXPECT_EQ(form.mostChildren, 1U);
    EXPECT_EQ(form.structure, (Bytes{0x01, 0x01, 0x00}));
    BPathTree back;
    EXPECT_EQ(read(back, form.structure, form.values), 1U);
    EXPECT_EQ(allPaths(back), Paths{"x/y/z"});
}

TEST(PathTreeForm, ARootWithFiveLeaves) {
    BPathTree tree;
    addBatch(tree, {}, {"1", "2", "3", "4", "5"});
    const Stored form = stored(tree);
    EXPECT_EQ(form.mostChildren, 5U);
    EXPECT_EQ(form.structure, (Bytes{0x02, 0x02, 0x02, 0x02, 0x00}));
    BPathTree back;
    EXPECT_EQ(read(back, form.structure, form.values), 5U);
    EXPECT_EQ(allPaths(back), (Paths{"1", "2", "3", "4", "5"}));
}

TEST(PathTreeForm, ATreeWithoutPathsIsNothing) {
    const Stored form = stored(BPathTree());
    EXPECT_EQ(form.mostChildren, 0U);
    EXPECT_TRUE(form.structure.empty());
    EXPECT_TRUE(form.values.empty());
}

TEST(PathTreeForm, NothingIsATreeWithoutPaths) {
    BPathTree tree;
    addWhole(tree, {"a"});
    EXPECT_EQ(read(tree, {}, {}), 0U);
    EXPECT_TRUE(tree.root->isLeaf());
    EXPECT_TRUE(allPaths(tree).empty());
}

// ---- Writing ----

TEST(PathTreeForm, TheMostChildrenMayBeDeepDown) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"1", "2", "3"});
    addBatch(tree, {"a"}, {"4"});
    EXPECT_EQ(stored(tree).mostChildren, 3U);
}

TEST(PathTreeForm, FoldersCloseInTheRightPlaces) {
    BPathTree tree;
    addBatch(tree, {"a", "b", "c"}, {"1"});
    addBatch(tree, {"a", "d"}, {});
    addBatch(tree, {"e"}, {"2", "3"});
    addBatch(tree, {"e", "f"}, {"4"});
    const Stored form = stored(tree);
    EXPECT_EQ(form.structure, (Bytes{
                                  0x03,  // a
                                  0x03,  // a/b
                                  0x01,  // a/b/c
                                  0x00,  // a/b/c/1
                                  0x00,  // a/d
                                  0x01,  // e
                                  0x02,  // e/2
                                  0x02,  // e/3
                                  0x01,  // e/f
                                  0x00,  // e/f/4
                              }));
    EXPECT_EQ(textsOf(form.values),
              (Paths{"a", "b", "c", "1", "d", "e", "2", "3", "f", "4"}));
}

TEST(PathTreeForm, WritingAppends) {
    BPathTree tree;
    addWhole(tree, {"x"});
    Bytes structure = {0xEE};
    Components values = components({"before"});
    tree.serialize(structure, values);
    EXPECT_EQ(structure, (Bytes{0xEE, 0x00}));
    EXPECT_EQ(textsOf(values), (Paths{"before", "x"}));
}

TEST(PathTreeForm, WritingLeavesThePassAlone) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"f", "g"});
    tree.reset();
    Components path;
    tree.getNextPath(path);
    stored(tree);
    tree.getNextPath(path);
    EXPECT_EQ(textsOf(path), (Paths{"a", "g"}));
}

TEST(PathTreeForm, EqualNamesAndEmptyOnesAreKept) {
    BPathTree tree;
    addBatch(tree, {""}, {"", "f", "", "f"});
    const Stored form = stored(tree);
    BPathTree back;
    EXPECT_EQ(read(back, form.structure, form.values), 4U);
    EXPECT_EQ(stored(back).structure, form.structure);
    EXPECT_EQ(stored(back).values, form.values);
}

// ---- Reading ----

TEST(PathTreeForm, ValuesThatBecomeNodesAreLeftEmpty) {
    Bytes structure = {0x02, 0x00};
    Components values = components({"a", "b", "unused"});
    BPathTree tree;
    tree.deserialize(structure, values);
    EXPECT_EQ(values, (Components{{}, {}, support::component("unused")}));
}

TEST(PathTreeForm, ReadingReplacesTheTree) {
    BPathTree tree;
    addWhole(tree, {"a", "b"});
    const BPathTree copy(tree);
    EXPECT_EQ(read(tree, {0x00}, components({"x"})), 1U);
    EXPECT_EQ(allPaths(tree), Paths{"x"});
    EXPECT_EQ(stored(copy).structure, (Bytes{0x01, 0x00}));
}

// A pass goes on through the nodes that it knows.
TEST(PathTreeForm, ReadingDoesNotResetThePass) {
    BPathTree tree;
    addBatch(tree, {"a"}, {"x", "y"});
    tree.reset();
    tessel::Components path;
    tree.getNextPath(path);
    read(tree, {0x00}, components({"b"}));
    EXPECT_EQ(tree.pendingNodes.size(), 1U);
    EXPECT_EQ(tree.parentNodes.size(), 2U);
    ASSERT_TRUE(tree.hasNextPath());
    tree.getNextPath(path);
    EXPECT_EQ(path, components({"a", "y"}));
    EXPECT_FALSE(tree.hasNextPath());
    EXPECT_EQ(allPaths(tree), Paths{"b"});
}

TEST(PathTreeForm, ALoadedTreeTakesInsertions) {
    BPathTree tree;
    read(tree, {0x03, 0x02, 0x00, 0x00}, components({"A", "a1", "a2", "B"}));
    EXPECT_EQ(addBatch(tree, {"A"}, {"a3"}),
              (support::BatchAdded{true, {0}, 2}));
    EXPECT_EQ(addWhole(tree, {"B", "b"}), (support::WholeAdded{false, {1}}));
    EXPECT_EQ(allPaths(tree), (Paths{"A/a1", "A/a2", "A/a3", "B/b"}));
}

TEST(PathTreeForm, EntriesAfterACompleteTreeAreIgnored) {
    BPathTree tree;
    EXPECT_EQ(read(tree,
                   {
                       0x01,  // last child, has children
                       0x00,  // its last child: complete
                       0x03,  // never looked at, and
                       0x07,  // never judged
                   },
                   someValues()),
              2U - 1U);
    EXPECT_EQ(allPaths(tree), Paths{"1/2"});
}

// Nodes of the tree that was read can stand where nodes of the old tree
// stood, which the insertions of old have searched.
TEST(PathTreeForm, ReadingForgetsWhatInsertionRemembered) {
    constexpr std::size_t folders = 2000;
    constexpr std::size_t filesEach = 12;
    const auto fill = [](BPathTree& tree, const char* name) {
        for (std::size_t i = 0; i < folders * filesEach; ++i)
            addWhole(tree, {support::numbered("d", i % folders),
                            support::numbered(name, i / folders)});
    };
    BPathTree source;
    fill(source, "new");
    const Stored form = stored(source);
    BPathTree tree;
    for (int round = 0; round < 3; ++round) {
        fill(tree, "old");
        read(tree, form.structure, form.values);
        for (std::size_t i = 0; i < folders; ++i) {
            const std::string folder = support::numbered("d", i);
            ASSERT_EQ(addWhole(tree, {folder, "new11"}),
                      (support::WholeAdded{true, {i, 11}}));
            ASSERT_EQ(addWhole(tree, {folder, "old3"}),
                      (support::WholeAdded{false, {i}}));
        }
    }
}

// ---- Hostile pairs ----

TEST(PathTreeForm, ACodeOfFourIsUnknown) {
    BPathTree tree;
    try {
        read(tree, {0x04}, someValues());
        FAIL() << "an unknown code was accepted";
    } catch (const tessel::UnknownNodeTypeException& failure) {
        EXPECT_STREQ(failure.what(),
                     "Cannot determine the node type for the given value.");
    }
    // The node of that entry is attached.
    EXPECT_EQ(support::childTexts(*tree.root), Paths{"1"});
}

TEST(PathTreeForm, TheValueOfAnUnknownCodeIsTakenOver) {
    BPathTree tree;
    Bytes structure = {0x03, 0x02, 0x09};
    tessel::Components values = support::components({"a", "b", "c", "d"});
    EXPECT_THROW(tree.deserialize(structure, values),
                 tessel::UnknownNodeTypeException);
    EXPECT_EQ(values, (support::components({"", "", "", "d"})));
}

TEST(PathTreeForm, EveryCodeAboveThreeIsUnknown) {
    for (unsigned code = 4; code < 256; ++code) {
        BPathTree tree;
        const auto byte = static_cast<std::uint8_t>(code);
        EXPECT_THROW(read(tree, {byte}, someValues()),
                     tessel::UnknownNodeTypeException);
        EXPECT_THROW(read(tree, {0x03, 0x02, byte}, someValues()),
                     tessel::UnknownNodeTypeException);
        EXPECT_EQ(stored(tree).values.size(), 3U);
    }
}

TEST(PathTreeForm, AFolderWithoutItsChild) {
    BPathTree tree;
    EXPECT_THROW(read(tree,
                      {
                          0x01,  // last child, has children: one must follow
                      },
                      someValues()),
                 DamagedFormException);
}

TEST(PathTreeForm, ASiblingThatIsMissing) {
    BPathTree tree;
    EXPECT_THROW(read(tree,
                      {
                          0x02,  // a leaf, a sibling must follow
                      },
                      someValues()),
                 DamagedFormException);
}

TEST(PathTreeForm, AFolderThatIsLastInAnOpenFolder) {
    BPathTree tree;
    EXPECT_THROW(read(tree,
                      {
                          0x03,  // a folder, a sibling must follow
                          0x01,  // its last child, a folder
                          0x00,  // its child; the root is not complete
                      },
                      someValues()),
                 DamagedFormException);
}

TEST(PathTreeForm, AMissingValue) {
    BPathTree tree;
    EXPECT_THROW(read(tree, {0x02, 0x02, 0x00}, components({"1", "2"})),
                 DamagedFormException);
    EXPECT_THROW(read(tree, {0x00}, {}), DamagedFormException);
}

TEST(PathTreeForm, ValuesWithoutStructure) {
    BPathTree tree;
    EXPECT_THROW(read(tree, {}, someValues()), DamagedFormException);
}

TEST(PathTreeForm, CutAtEveryEntryItIsRefused) {
    BPathTree tree;
    addBatch(tree, {"a", "b"}, {"1", "2"});
    addBatch(tree, {"c"}, {"3"});
    const Stored form = stored(tree);
    for (std::size_t length = 0; length < form.structure.size(); ++length) {
        const auto end = static_cast<std::ptrdiff_t>(length);
        const Bytes structure(form.structure.begin(),
                              form.structure.begin() + end);
        const Components values(form.values.begin(), form.values.begin() + end);
        BPathTree back;
        EXPECT_THROW(read(back, structure, form.values), DamagedFormException);
        EXPECT_THROW(read(back, form.structure, values), DamagedFormException);
        // A tree that was refused can be used on.
        read(back, form.structure, form.values);
        EXPECT_EQ(allPaths(back), (Paths{"a/b/1", "a/b/2", "c/3"}));
    }
}

TEST(PathTreeForm, EveryShortStructureIsATreeOrRefused) {
    // All structures of up to five codes of 0 to 4.
    for (unsigned length = 1; length <= 5; ++length) {
        unsigned count = 1;
        for (unsigned i = 0; i < length; ++i) count *= 5;
        for (unsigned number = 0; number < count; ++number) {
            Bytes structure;
            for (unsigned i = 0, rest = number; i < length; ++i, rest /= 5)
                structure.push_back(static_cast<std::uint8_t>(rest % 5));
            BPathTree tree;
            try {
                const std::size_t leaves = read(tree, structure, someValues());
                EXPECT_EQ(allPaths(tree).size(), leaves);
                const Bytes again = stored(tree).structure;
                ASSERT_LE(again.size(), structure.size());
                structure.resize(again.size());
                EXPECT_EQ(again, structure);
            } catch (const DamagedFormException&) {
                EXPECT_EQ(stored(tree).values.size(), structure.size());
            } catch (const tessel::UnknownNodeTypeException&) {
                EXPECT_EQ(structure[stored(tree).values.size() - 1], 4);
            }
        }
    }
}

}  // namespace
