// Every fast route of the library beside the plain one that it must equal.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <algorithm>
#include <map>
#include <stack>

#include "coder/FolderMemo.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Generators.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::Bytes;
using tessel::BNode;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::ChildFinder;
using tessel::Component;
using tessel::ComponentPacker;
using tessel::Components;
using tessel::PackedComponents;
using tessel::PathTrack;
using tessel::PathTracks;

// ---- Finding a child: a search from the front ----

// A name out of `kinds`, so that equal ones meet.
Component nameOf(unsigned number, unsigned kinds) {
    const unsigned kind = number % kinds;
    return {static_cast<std::uint8_t>(kind),
            static_cast<std::uint8_t>(kind >> 8)};
}

void compareFinder(ChildFinder& finder, const BPathTree& tree, BNode& parent,
                   const Component& value) {
    const std::uint64_t expected = tree.findNode(value, parent.children());
    const ChildFinder::Found found = finder.find(parent, value);
    RC_ASSERT(found.position == expected);
    if (expected != BPathTree::allOnes)
        RC_ASSERT(found.child == &parent.children()[found.position]);
}

RC_GTEST_PROP(ChildFinder, FindsWhatASearchFromTheFrontFinds, ()) {
    BPathTree tree;
    support::addBatch(tree, {}, {"first", "second", "third"});
    ChildFinder finder;
    const auto kinds = *rc::gen::inRange(1U, 3000U);
    const auto rounds =
        *rc::gen::container<std::vector<std::pair<unsigned, unsigned>>>(
            rc::gen::pair(rc::gen::inRange(0U, 400U),
                          rc::gen::arbitrary<unsigned>()));
    for (const auto& [count, start] : rounds) {
        BNode& parent = tree.root->children()[start % 3];
        Components files;
        for (unsigned i = 0; i < count; ++i)
            files.push_back(nameOf(start + i * 7, kinds));
        Components folder = {
            Component(parent.value().begin(), parent.value().end())};
        PathTrack track;
        std::uint64_t first = 0;
        tree.addPath(folder, files, track, first);
        for (unsigned i = 0; i < 10; ++i)
            compareFinder(finder, tree, parent,
                          nameOf(start / 3 + i * 11, kinds));
        compareFinder(finder, tree, parent, {});
    }
    for (unsigned i = 0; i < kinds; i += 1 + kinds / 50)
        compareFinder(finder, tree, tree.root->children()[i % 3],
                      nameOf(i, kinds));
    finder.clear();
    RC_ASSERT(finder.memoryBytes() == 0U);
    compareFinder(finder, tree, tree.root->children()[0], nameOf(1, kinds));
}

// Insertion by the tree, its copies and whole batches in turn: each must
// find what a search from the front finds, whoever added it.
RC_GTEST_PROP(ChildFinder, InsertionFindsWhatASearchFromTheFrontFinds, ()) {
    BPathTree tree;
    BPathTree copy(tree);
    const auto kinds = *rc::gen::inRange(1U, 300U);
    const auto steps =
        *rc::gen::scale(4, rc::gen::container<std::vector<unsigned>>(
                               rc::gen::arbitrary<unsigned>()));
    for (const unsigned step : steps) {
        BPathTree& used = step % 3 == 0 ? copy : tree;
        if (step % 11 == 0) used.releaseFinder();
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

TEST(ChildFinder, AroundTheWidthWhereTablesBegin) {
    for (unsigned width = 1; width < 40; ++width) {
        BPathTree tree;
        ChildFinder finder;
        for (unsigned i = 0; i < width; ++i) {
            support::addBatch(tree, {}, {support::numbered("n", i)});
            for (unsigned k = 0; k <= i; ++k) {
                const auto found = finder.find(
                    *tree.root, support::component(support::numbered("n", k)));
                EXPECT_EQ(found.position, k);
            }
            EXPECT_EQ(finder.find(*tree.root, support::component("x")).child,
                      nullptr);
        }
    }
}

TEST(ChildFinder, AFolderOfManyThousandsWithEqualNamesBetween) {
    BPathTree tree;
    constexpr unsigned count = 30000;
    constexpr unsigned kinds = 20000;
    Components files;
    for (unsigned i = 0; i < count; ++i) files.push_back(nameOf(i, kinds));
    Components folder = {{1}};
    PathTrack track;
    std::uint64_t first = 0;
    tree.addPath(folder, files, track, first);
    BNode& parent = tree.root->children()[0];
    ChildFinder finder;
    for (unsigned i = 0; i < kinds; ++i)
        ASSERT_EQ(finder.find(parent, nameOf(i, kinds)).position, i);
    EXPECT_EQ(finder.find(parent, nameOf(kinds, kinds + 1)).child, nullptr);
    EXPECT_EQ(finder.indexedChildren(), count);
    EXPECT_GT(finder.memoryBytes(), 8 * count);
    finder.clear();
    EXPECT_EQ(finder.indexedChildren(), 0U);
}

// So many names that some share all the bits of a hash that are kept.
TEST(ChildFinder, NamesOfEqualHashAreToldApart) {
    BPathTree tree;
    constexpr std::size_t count = 400000;
    for (std::size_t i = 0; i < count; ++i) {
        Components path = {support::littleEndian(i, 4)};
        PathTrack track;
        ASSERT_FALSE(tree.addPath(path, track)) << i;
    }
    EXPECT_EQ(tree.root->children().size(), count);
}

TEST(ChildFinder, AWideFolderOfFoldersIsBuiltWithoutADuplicate) {
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

// ---- Path tracks: a list of lists ----

rc::Gen<std::uint64_t> anyPosition() {
    return rc::gen::weightedOneOf<std::uint64_t>(
        {{4, rc::gen::inRange<std::uint64_t>(0, 130)},
         {2,
          rc::gen::map(rc::gen::inRange(0U, 64U),
                       [](unsigned bit) { return std::uint64_t{1} << bit; })},
         {1, rc::gen::map(rc::gen::inRange(0U, 64U), [](unsigned bits) {
              return ~std::uint64_t{0} >> bits;
          })}});
}

rc::Gen<PathTrack> anyTrack() {
    return rc::gen::weightedOneOf<PathTrack>(
        {{10, rc::gen::container<PathTrack>(anyPosition())},
         {1, rc::gen::map(anyPosition(), [](std::uint64_t position) {
              return PathTrack(200, position);
          })}});
}

RC_GTEST_PROP(PathTracks, EqualAListOfLists,
              (const std::vector<int>& /*for its size*/)) {
    const auto expected =
        *rc::gen::container<std::vector<PathTrack>>(anyTrack());
    PathTracks tracks;
    PathTracks reserved;
    for (const PathTrack& track : expected) {
        tracks.push_back(track);
        reserved.reserveFor(track.size());
        reserved.push_back(track);
    }
    RC_ASSERT(tracks == reserved);
    RC_ASSERT(tracks.size() == expected.size());
    RC_ASSERT(tracks.empty() == expected.empty());
    for (std::size_t i = 0; i < expected.size(); ++i)
        RC_ASSERT(tracks[i] == expected[i]);
    if (!expected.empty()) {
        RC_ASSERT(tracks.front() == expected.front());
        RC_ASSERT(tracks.back() == expected.back());
    }
    std::vector<PathTrack> visited;
    tracks.forEach(
        [&visited](const PathTrack& track) { visited.push_back(track); });
    RC_ASSERT(visited == expected);

    PathTracks copy = tracks;
    copy.shrinkToFit();
    RC_ASSERT(copy == tracks);
    RC_ASSERT(copy.memoryBytes() <= tracks.memoryBytes());
    copy.push_back({1});
    RC_ASSERT(!(copy == tracks));
    RC_ASSERT(copy.back() == PathTrack{1});
}

TEST(PathTracks, ATrackTakesAboutAByteAPosition) {
    PathTracks tracks;
    for (unsigned i = 0; i < 10000; ++i) tracks.push_back({1, i % 100, 3, 4});
    tracks.shrinkToFit();
    EXPECT_LE(tracks.memoryBytes(), 10000U * 6);
    EXPECT_EQ(tracks[9999], (PathTrack{1, 99, 3, 4}));
}

// ---- The stack of nodes: a standard stack ----

RC_GTEST_PROP(NodeStack, EqualsAStandardStack, ()) {
    BPathTree tree;
    for (std::size_t i = 0; i < 5; ++i) {
        const std::vector<std::string> files(i, "f");
        support::addBatch(tree, {support::numbered("folder", i)}, files);
    }
    std::vector<BNodePtr> nodes = {tree.root};
    for (std::size_t i = 0; i < 5; ++i)
        nodes.emplace_back(&tree.root->children()[i]);
    tessel::NodeStack actual;
    std::stack<BNode*> expected;
    const auto steps =
        *rc::gen::container<std::vector<unsigned>>(rc::gen::inRange(0U, 18U));
    for (const unsigned step : steps) {
        const BNodePtr& node = nodes[step % 6];
        if (step < 6) {
            actual.push(node);
            expected.push(node.get());
        } else if (step < 12) {
            const tessel::ChildList children = node->children();
            actual.pushChildren(node);
            for (std::size_t i = children.size(); i-- > 0;)
                expected.push(&children[i]);
        } else if (!expected.empty()) {
            actual.pop();
            expected.pop();
        }
        RC_ASSERT(actual.size() == expected.size());
        RC_ASSERT(actual.empty() == expected.empty());
        if (!expected.empty()) RC_ASSERT(&actual.top() == expected.top());
    }
    tessel::NodeStack copy = actual;
    actual.clear();
    RC_ASSERT(actual.empty());
    while (!expected.empty()) {
        RC_ASSERT(&copy.top() == expected.top());
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
}

TEST(NodeStack, KeepsItsNodesAlive) {
    tessel::NodeStack stack;
    {
        BPathTree tree;
        support::addBatch(tree, {"a"}, {"f", "g"});
        stack.push(BNodePtr(&tree.root->children()[0]));
        stack.pushChildren(BNodePtr(&tree.root->children()[0]));
    }
    EXPECT_EQ(support::textOf(stack.top().value()), "f");
    stack.pop();
    EXPECT_EQ(support::textOf(stack.top().value()), "g");
    stack.pop();
    EXPECT_EQ(support::childTexts(stack.top()),
              (std::vector<std::string>{"f", "g"}));
}

// ---- Packed components: a list of byte vectors ----

rc::Gen<Component> anyComponent() {
    return rc::gen::weightedOneOf<Component>(
        {{10, rc::gen::container<Component>(support::anyByte())},
         {1, rc::gen::map(
                 rc::gen::element<std::size_t>(253, 254, 255, 256, 1000, 70000),
                 [](std::size_t length) { return Component(length, 0x5A); })}});
}

Components unpacked(const PackedComponents& list) {
    Components components;
    for (const tessel::ComponentView value : list)
        components.emplace_back(value.begin(), value.end());
    return components;
}

RC_GTEST_PROP(PackedComponents, EqualListsOfComponents, ()) {
    const auto expected = *rc::gen::container<std::vector<Components>>(
        rc::gen::scale(0.2, rc::gen::container<Components>(anyComponent())));
    ComponentPacker packer;
    std::vector<PackedComponents> lists;
    for (const Components& components : expected)
        lists.push_back(support::packedBy(packer, components));
    const auto buffers = packer.takeBuffers();
    for (std::size_t i = 0; i < expected.size(); ++i) {
        RC_ASSERT(lists[i].size() == expected[i].size());
        RC_ASSERT(lists[i].empty() == expected[i].empty());
        RC_ASSERT(unpacked(lists[i]) == expected[i]);
        for (std::size_t k = 0; k < i; ++k)
            RC_ASSERT(
                tessel::sameComponent(lists[i].bytes(), lists[k].bytes()) ==
                (expected[i] == expected[k]));
    }
}

TEST(PackedComponents, APackerIsAsNewAfterItsBuffersWereTaken) {
    ComponentPacker packer;
    const auto first = support::packedBy(packer, {{1, 2}, {3}});
    const auto firstBuffers = packer.takeBuffers();
    const auto second = support::packedBy(packer, {{4}});
    EXPECT_EQ(unpacked(first), (Components{{1, 2}, {3}}));
    EXPECT_EQ(unpacked(second), (Components{{4}}));
}

TEST(PackedComponents, TheSlackBehindAComponentMayBeWritten) {
    ComponentPacker packer;
    for (std::size_t length = 0; length < 3000; ++length) {
        std::uint8_t* to = packer.extend(length);
        std::fill_n(to, length + ComponentPacker::slack,
                    static_cast<std::uint8_t>(length));
    }
    const PackedComponents list = packer.finish();
    std::size_t length = 0;
    for (const tessel::ComponentView value : list) {
        ASSERT_EQ(value.size(), length);
        for (const std::uint8_t byte : value)
            ASSERT_EQ(byte, static_cast<std::uint8_t>(length));
        ++length;
    }
    EXPECT_EQ(length, 3000U);
}

// A batch that is inserted packed equals one that is inserted unpacked.
RC_GTEST_PROP(PackedComponents, InsertionEqualsThatOfVectors, ()) {
    const auto component =
        rc::gen::container<Component>(1, rc::gen::inRange<std::uint8_t>(0, 4));
    const auto batches =
        *rc::gen::container<std::vector<std::pair<Components, Components>>>(
            rc::gen::scale(
                0.1, rc::gen::pair(rc::gen::container<Components>(component),
                                   rc::gen::container<Components>(component))));
    BPathTree plain;
    BPathTree packed;
    for (const auto& [folder, files] : batches) {
        Components folderVectors = folder;
        Components fileVectors = files;
        PathTrack plainTrack;
        std::uint64_t first = 0;
        const bool plainExisted =
            plain.addPath(folderVectors, fileVectors, plainTrack, first);
        ComponentPacker packer;
        const auto folderList = support::packedBy(packer, folder);
        const auto fileList = support::packedBy(packer, files);
        PathTrack packedTrack;
        bool packedExisted = false;
        BNode& node = packed.addFolder(folderList, packedTrack, packedExisted);
        const std::uint64_t position = packed.addFiles(node, fileList);
        RC_ASSERT(packedExisted == plainExisted);
        RC_ASSERT(packedTrack == plainTrack);
        if (plainExisted) RC_ASSERT(position == first);
    }
    RC_ASSERT(support::storedTree(packed) == support::storedTree(plain));
}

// ---- The memo of folders: a map ----

RC_GTEST_PROP(FolderMemo, EqualsAMap, ()) {
    const auto component =
        rc::gen::container<Component>(1, rc::gen::inRange<std::uint8_t>(0, 6));
    const auto folders = *rc::gen::scale(
        5, rc::gen::container<std::vector<Components>>(rc::gen::scale(
               0.01, rc::gen::container<Components>(component))));
    BPathTree tree;
    tessel::FolderMemo memo;
    ComponentPacker packer;
    std::map<Components, std::pair<BNode*, PathTrack>> expected;
    for (const Components& components : folders) {
        const auto list = support::packedBy(packer, components);
        const auto hash = tessel::FolderMemo::hashOf(list);
        const auto known = expected.find(components);
        const tessel::FolderMemo::Folder* found = memo.find(list, hash);
        RC_ASSERT((found != nullptr) == (known != expected.end()));
        if (found != nullptr) {
            const auto track = memo.trackOf(*found);
            RC_ASSERT(found->node == known->second.first);
            RC_ASSERT(PathTrack(track.begin(), track.end()) ==
                      known->second.second);
            continue;
        }
        PathTrack track;
        bool existed = false;
        BNode& node = tree.addFolder(list, track, existed);
        memo.add(list, hash, node, track);
        expected[components] = {&node, track};
    }
}

TEST(FolderMemo, FoldersOfEqualHashAreToldApart) {
    constexpr std::size_t count = 400000;
    tessel::FolderMemo memo;
    ComponentPacker packer;
    BPathTree tree;
    for (std::size_t i = 0; i < count; ++i) {
        const auto list =
            support::packedBy(packer, {support::littleEndian(i, 4)});
        const auto hash = tessel::FolderMemo::hashOf(list);
        ASSERT_EQ(memo.find(list, hash), nullptr) << i;
        memo.add(list, hash, *tree.root, {i});
    }
}

// ---- Lookup by number: a merge, step by step ----

// A coder with one folder of many files, and partitions that end anywhere.
struct Crafted {
    model::Coder expected;
    support::CoderPtr coder = std::make_unique<tessel::HuffmanPathTree>();
};

Crafted crafted(const std::vector<std::uint64_t>& ends) {
    Crafted both;
    both.expected.code = model::buildCode(u"ab", {1, 1});
    model::Path files;
    for (unsigned i = 0; i < 60; ++i)
        files.push_back({static_cast<std::uint8_t>(i), 0});
    both.expected.addPartition({{1, 1}}, files);
    for (unsigned i = 0; i < 10; ++i) {
        const auto name = static_cast<std::uint8_t>(i);
        both.expected.addPartition({{1, 1}, {name, 3}}, {{2, 2}});
    }
    both.expected.partitionEnds = ends;
    both.expected.partitionTracks.clear();
    for (std::size_t k = 0; k < ends.size(); ++k) {
        const model::Track tracks[] = {{0}, {0, 60 + k % 10}, {0, k % 60}, {}};
        both.expected.partitionTracks.push_back(tracks[k % 4]);
    }
    Bytes form = both.expected.form().bytes();
    both.coder->deserialize(form, false);
    both.expected = both.expected.restored();
    return both;
}

void compareLookup(const Crafted& both, const std::vector<double>& numbers) {
    const auto expected = both.expected.getPath(numbers);
    const auto answer = support::found(*both.coder, numbers);
    RC_ASSERT(answer.has_value() == expected.has_value());
    if (!expected) return;
    RC_ASSERT(answer->folders == expected->folders);
    RC_ASSERT(answer->files == expected->files);
}

RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeWhereverPartitionsEnd, ()) {
    const auto ends =
        *rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100)));
    const Crafted both = crafted(ends);
    const auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(0, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
    std::vector<double> sorted = numbers;
    std::sort(sorted.begin(), sorted.end());
    compareLookup(both, sorted);
    sorted.erase(std::remove(sorted.begin(), sorted.end(), 0), sorted.end());
    compareLookup(both, sorted);

    // A copy, and the coder after one more batch, keep the ends' order.
    Crafted copied;
    copied.expected = both.expected;
    copied.coder->copyTree(*both.coder);
    compareLookup(copied, sorted);
    Components folder = {{1, 1}};
    Components files = {{5, 5}};
    copied.expected.addPartition(folder, files);
    copied.coder->addPathToBTree(folder, files);
    compareLookup(copied, sorted);
    compareLookup(copied, numbers);
}

// Two forms read one after the other: the ends begin again.
RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeAfterASecondForm, ()) {
    const auto ends = rc::gen::map(
        rc::gen::nonEmpty(rc::gen::container<std::vector<std::uint64_t>>(
            rc::gen::inRange<std::uint64_t>(0, 100))),
        [](std::vector<std::uint64_t> list) {
            std::sort(list.begin(), list.end());
            return list;
        });
    Crafted both = crafted(*ends);
    const Crafted second = crafted(*ends);
    Bytes form = second.expected.form().bytes();
    both.coder->deserialize(form, false);
    for (const std::uint64_t end : second.expected.partitionEnds)
        both.expected.partitionEnds.push_back(end);
    for (const model::Track& track : second.expected.partitionTracks)
        both.expected.partitionTracks.push_back(track);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange(1, 110),
                     [](int n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
}

RC_GTEST_PROP(PathLookupTwin, EqualsTheMergeInManyPartitions, ()) {
    const auto sizes = *rc::gen::scale(
        10, rc::gen::nonEmpty(rc::gen::container<std::vector<unsigned>>(
                rc::gen::inRange(0U, 4U))));
    std::vector<std::uint64_t> ends;
    std::uint64_t end = 0;
    for (const unsigned size : sizes) ends.push_back(end += size);
    const Crafted both = crafted(ends);
    auto numbers = *rc::gen::container<std::vector<double>>(
        rc::gen::map(rc::gen::inRange<std::uint64_t>(1, end + 3),
                     [](std::uint64_t n) { return static_cast<double>(n); }));
    compareLookup(both, numbers);
    std::sort(numbers.begin(), numbers.end());
    compareLookup(both, numbers);
    for (const double number : numbers) compareLookup(both, {number});
}

}  // namespace
