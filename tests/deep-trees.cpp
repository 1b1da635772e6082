// Trees as deep as they have nodes, on a small stack: nothing recurses.

#include <gtest/gtest.h>
#include <pthread.h>

#include <functional>

#include "archive/PathArchive.hpp"
#include "paths/PathStore.hpp"
#include "tests/paths/Stores.hpp"
#include "tests/support/Coders.hpp"
#include "tests/support/Trees.hpp"

namespace {

using support::Bytes;
using support::CoderPtr;
using tessel::BNodePtr;
using tessel::BPathTree;
using tessel::Component;
using tessel::Components;
using tessel::PathTrack;

#ifdef QZTESSEL_SLOWED
constexpr std::size_t chainLength = 1'000'000;
constexpr std::size_t coderDepth = 200'000;
#else
constexpr std::size_t chainLength = 2'000'000;
constexpr std::size_t coderDepth = chainLength;
#endif

// Far less than so many frames of any function.
constexpr std::size_t smallStack = std::size_t{512} << 10;

void* callTask(void* task) {
    (*static_cast<std::function<void()>*>(task))();
    return nullptr;
}

void onSmallStack(std::function<void()> task) {
    pthread_attr_t attributes;
    ASSERT_EQ(pthread_attr_init(&attributes), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&attributes, smallStack), 0);
    pthread_t thread{};
    ASSERT_EQ(pthread_create(&thread, &attributes, &callTask, &task), 0);
    pthread_join(thread, nullptr);
    pthread_attr_destroy(&attributes);
}

Components chain(std::size_t length) {
    return Components(length, Component{1});
}

void addChain(BPathTree& tree, std::size_t length) {
    Components path = chain(length);
    PathTrack track;
    tree.addPath(path, track);
}

TEST(DeepTrees, AChainOfMillionsOfNodesIsReleased) {
    onSmallStack([] {
        BPathTree tree;
        addChain(tree, chainLength);
    });
}

TEST(DeepTrees, AChainOfLateFoldersIsReleased) {
    // Each node was made as a file and got its child later.
    onSmallStack([] {
        BPathTree tree;
        tessel::ChildList children = tree.root->children();
        for (std::size_t i = 0; i < chainLength; ++i) {
            bool existed = false;
            Component value = {1};
            tree.addIfExistsAndFind(children, value, existed);
            children = children[0].children();
        }
    });
}

TEST(DeepTrees, AChainWithFilesAtEachLevelIsReleased) {
    onSmallStack([] {
        BPathTree tree;
        tessel::ChildList children = tree.root->children();
        for (std::size_t i = 0; i < chainLength / 4; ++i) {
            bool existed = false;
            for (const std::uint8_t name : Component{7, 8, 1, 9}) {
                Component value = {name};
                tree.addIfExistsAndFind(children, value, existed);
            }
            children = children[2].children();
        }
    });
}

TEST(DeepTrees, WhatACopyHoldsStaysWhenTheSourceIsReleased) {
    onSmallStack([] {
        auto source = std::make_unique<BPathTree>();
        addChain(*source, chainLength);
        BPathTree copy(*source);
        source.reset();
        copy.reset();
        Components path;
        copy.getNextPath(path);
        EXPECT_EQ(path, chain(chainLength));
    });
}

TEST(DeepTrees, WhatAHandleHoldsStaysWhenTheTreeIsReleased) {
    onSmallStack([] {
        BNodePtr held;
        {
            BPathTree tree;
            addChain(tree, chainLength);
            tessel::BNode node = *tree.root;
            for (std::size_t i = 0; i < chainLength / 2; ++i)
                node = node.children()[0];
            held = BNodePtr(node);
        }
        std::size_t below = 0;
        for (tessel::BNode node = *held; !node.isLeaf();
             node = node.children()[0])
            ++below;
        EXPECT_EQ(below, chainLength - chainLength / 2);
    });
}

TEST(DeepTrees, AChainIsStoredAndReadBack) {
    onSmallStack([] {
        BPathTree tree;
        addChain(tree, chainLength);
        auto [structure, values] = support::storedTree(tree);
        EXPECT_EQ(structure.size(), chainLength);
        BPathTree back;
        EXPECT_EQ(back.deserialize(structure, values), 1U);
        EXPECT_EQ(support::storedTree(back).first, structure);
        EXPECT_GT(tree.memoryUsage().nodes, chainLength);
    });
}

TEST(DeepTrees, ACoderWithADeepFolderDoesEverything) {
    onSmallStack([] {
        constexpr std::size_t depth = coderDepth;
        const CoderPtr coder = support::fourLetterCoder();
        Components folder = chain(depth);
        Components files = {{2}, {3}};
        coder->addPathToBTree(folder, files);
        const Bytes form = support::formOf(*coder, true);
        const CoderPtr back = support::restoredFrom(form, true, *coder);
        EXPECT_EQ(back->maxPartitionTrackLength, depth);
        const auto answer = support::found(*back, {2});
        ASSERT_TRUE(answer);
        EXPECT_EQ(answer->folders[0].size(), depth);
        EXPECT_EQ(answer->files[0], Components{{3}});
        back->resetPathsToBTree();
        Components path;
        back->getNextPathFromBTree(path);
        EXPECT_EQ(path.size(), depth + 1);
        tessel::HuffmanPathTree copy;
        copy.copyTree(*back);
        EXPECT_GT(copy.memoryUsage().total(), depth);
        EXPECT_EQ(support::formOf(copy, true), form);
    });
}

// A path of so many folders of one character each.
std::string deepPath(std::size_t depth) {
    std::string path;
    for (std::size_t i = 0; i < depth; ++i) path += "d/";
    return path + "f";
}

TEST(DeepTrees, AStoreWithADeepPathDoesEverything) {
    onSmallStack([] {
        const std::vector<std::string> paths = {deepPath(coderDepth), "d/f"};
        tessel::PathStore store = tessel::PathStore::from(paths);
        EXPECT_EQ(stores::iterated(store), paths);
        EXPECT_EQ(stores::inTreeOrder(store), paths);
        EXPECT_EQ(store[0], paths[0]);
        store = tessel::PathStore::load(store.save());
        store.append(paths[0] + "g");
        EXPECT_EQ(store[0], paths[0]);
        EXPECT_EQ(store[2], paths[0] + "g");
    });
}

// An archive's folders have at most 1 MiB.
TEST(DeepTrees, AnArchiveTakesADeepPathUpToItsLimit) {
    onSmallStack([] {
        constexpr std::size_t deepest = std::size_t{1} << 19;
        const std::vector<std::string> paths = {deepPath(deepest), "d/f"};
        std::vector<std::uint8_t> bytes;
        tessel::ArchiveWriter writer(bytes);
        writer.addAll(paths);
        EXPECT_THROW(writer.add(deepPath(deepest + 1)), std::length_error);
        EXPECT_THROW(writer.add(deepPath(2'000'000)), std::length_error);
        writer.finish();
        const auto archive = tessel::PathArchive::own(bytes);
        ASSERT_EQ(archive.size(), paths.size());
        EXPECT_EQ(archive[0], paths[0]);
        EXPECT_EQ(archive.numberOf(paths[0]), 0U);
        EXPECT_EQ(archive.numberOf(deepPath(deepest - 1)), std::nullopt);
        EXPECT_EQ(
            archive.folder(deepPath(deepest - 1).substr(0, 2 * (deepest - 1))),
            (std::vector<tessel::NumberRange>{{0, 1}}));
        EXPECT_EQ(archive.find("/d/f"), (std::vector<std::uint64_t>{0}));
        archive.verify();
    });
}

TEST(DeepTrees, ADeepCodeIsWalkedWithoutRecursion) {
    onSmallStack([] {
        constexpr std::size_t leaves = 65536;
        tessel::HuffmanPathTree coder;
        std::u16string characters;
        for (std::size_t i = 0; i < leaves; ++i) {
            if (i + 1 < leaves) coder.boolTree.push_back(false);
            coder.boolTree.push_back(true);
            characters.push_back(static_cast<char16_t>(i));
        }
        coder.inflateHuffman(characters);
        const std::u16string text = {0, 60000, 3, 65535, 1};
        EXPECT_EQ(coder.generatePathFrom(coder.generateCodeFor(text)), text);
        std::size_t visits = 0;
        coder.traverse(
            [&visits](tessel::HuffmanPathTree*, tessel::HNode&) { ++visits; });
        EXPECT_EQ(visits, 2 * leaves - 1);
    });
}

}  // namespace
