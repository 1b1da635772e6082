// Finding a child, beside a search from the front.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include "pathtree/BPathTree.hpp"
#include "pathtree/ChildIndex.hpp"
#include "pathtree/TreeInserter.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BNode;
using tessel::BPathTree;
using tessel::ChildIndex;
using tessel::Component;
using tessel::Components;
using tessel::PathTrack;

// A name out of `kinds`, so that equal ones meet.
Component nameOf(unsigned number, unsigned kinds) {
    const unsigned kind = number % kinds;
    return {static_cast<std::uint8_t>(kind),
            static_cast<std::uint8_t>(kind >> 8)};
}

void compareIndex(ChildIndex& index, const BPathTree& tree, BNode parent,
                  const Component& value) {
    const std::uint64_t expected = tree.findNode(value, parent.children());
    if (tessel::FolderNode* const folder = parent.folder())
        RC_ASSERT(index.find(*folder, value) == expected);
}

RC_GTEST_PROP(ChildIndex, FindsWhatASearchFromTheFrontFinds, ()) {
    BPathTree tree;
    support::addBatch(tree, {}, {"first", "second", "third"});
    ChildIndex index;
    const auto kinds = *rc::gen::inRange(1U, 3000U);
    const auto rounds =
        *rc::gen::container<std::vector<std::pair<unsigned, unsigned>>>(
            rc::gen::pair(rc::gen::inRange(0U, 400U),
                          rc::gen::arbitrary<unsigned>()));
    for (const auto& [count, start] : rounds) {
        BNode parent = tree.root->children()[start % 3];
        Components files;
        for (unsigned i = 0; i < count; ++i)
            files.push_back(nameOf(start + i * 7, kinds));
        Components folder = {
            Component(parent.value().begin(), parent.value().end())};
        PathTrack track;
        std::uint64_t first = 0;
        tree.addPath(folder, files, track, first);
        for (unsigned i = 0; i < 10; ++i)
            compareIndex(index, tree, parent,
                         nameOf(start / 3 + i * 11, kinds));
        compareIndex(index, tree, parent, {});
    }
    for (unsigned i = 0; i < kinds; i += 1 + kinds / 50)
        compareIndex(index, tree, tree.root->children()[i % 3],
                     nameOf(i, kinds));
    index.clear();
    RC_ASSERT(index.memoryBytes() == 0U);
    compareIndex(index, tree, tree.root->children()[0], nameOf(1, kinds));
}

// Insertion by the tree, its copies and whole batches in turn: each must
// find what a search from the front finds, whoever added it.
RC_GTEST_PROP(ChildIndex, InsertionFindsWhatASearchFromTheFrontFinds, ()) {
    BPathTree tree;
    BPathTree copy(tree);
    const auto kinds = *rc::gen::inRange(1U, 300U);
    const auto steps =
        *rc::gen::scale(4, rc::gen::container<std::vector<unsigned>>(
                               rc::gen::arbitrary<unsigned>()));
    for (const unsigned step : steps) {
        BPathTree& used = step % 3 == 0 ? copy : tree;
        if (step % 11 == 0) used.inserter().releaseIndex();
        if (step % 13 == 0) used.reset();
        const Component value = nameOf(step / 16, kinds);
        if (step % 5 == 0) {  // appended unseen, equal ones too
            Components files = {value, {}, value};
            Components none;
            PathTrack track;
            std::uint64_t first = 0;
            used.addPath(none, files, track, first);
            continue;
        }
        const std::size_t before = tree.root->children().size();
        const std::uint64_t expected =
            tree.findNode(value, tree.root->children());
        Components path = {value};
        PathTrack track;
        const bool existed = used.addPath(path, track);
        RC_ASSERT(existed == (expected != BPathTree::allOnes));
        RC_ASSERT(track == (existed ? PathTrack{expected} : PathTrack{}));
        RC_ASSERT(tree.root->children().size() == before + (existed ? 0 : 1));
    }
}

TEST(ChildIndex, AroundTheWidthWhereTablesBegin) {
    for (unsigned width = 1; width < 40; ++width) {
        BPathTree tree;
        ChildIndex index;
        for (unsigned i = 0; i < width; ++i) {
            support::addBatch(tree, {}, {support::numbered("n", i)});
            for (unsigned k = 0; k <= i; ++k) {
                const auto name = support::component(support::numbered("n", k));
                EXPECT_EQ(index.find(*tree.root->folder(), name), k);
            }
            EXPECT_EQ(index.find(*tree.root->folder(), support::component("x")),
                      ChildIndex::notFound);
        }
    }
}

TEST(ChildIndex, AFolderOfManyThousandsWithEqualNamesBetween) {
    BPathTree tree;
    constexpr unsigned count = 30000;
    constexpr unsigned kinds = 20000;
    Components files;
    for (unsigned i = 0; i < count; ++i) files.push_back(nameOf(i, kinds));
    Components folder = {{1}};
    PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, files, track, first);
    tessel::FolderNode& parent = *tree.root->children()[0].folder();
    ChildIndex index;
    for (unsigned i = 0; i < kinds; ++i)
        ASSERT_EQ(index.find(parent, nameOf(i, kinds)), i);
    EXPECT_EQ(index.find(parent, nameOf(kinds, kinds + 1)),
              ChildIndex::notFound);
    EXPECT_EQ(index.indexedChildren(), count);
    EXPECT_GT(index.memoryBytes(), 8 * count);
    index.clear();
    EXPECT_EQ(index.indexedChildren(), 0U);
}

// So many names that some share all the bits of a hash that are kept.
TEST(ChildIndex, NamesOfEqualHashAreToldApart) {
    BPathTree tree;
    constexpr std::size_t count = 400000;
    for (std::size_t i = 0; i < count; ++i) {
        Components path = {support::littleEndian(i, 4)};
        PathTrack track;
        ASSERT_FALSE(tree.addPath(path, track)) << i;
    }
    EXPECT_EQ(tree.root->children().size(), count);
}

TEST(ChildIndex, AWideFolderOfFoldersIsBuiltWithoutADuplicate) {
    BPathTree tree;
    for (int round = 0; round < 3; ++round) {
        for (unsigned i = 0; i < 3000; ++i) {
            const std::string name = support::numbered("folder", i * 7 % 3000);
            const auto added = support::addBatch(tree, {name}, {"file"});
            ASSERT_EQ(added.existed, round > 0);
            ASSERT_EQ(added.track, (PathTrack{i}));
        }
    }
    EXPECT_EQ(tree.root->children().size(), 3000U);
}

}  // namespace
