// What a store is when memory runs out, at every allocation in turn.

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "paths/PathStore.hpp"
#include "tests/paths/Stores.hpp"
#include "tests/support/EachAllocation.hpp"
#include "tests/support/Sizes.hpp"

namespace {

using stores::inTreeOrder;
using stores::iterated;
using support::atEachAllocation;
using tessel::PathStore;
using Strings = std::vector<std::string>;

// By every way out, these paths and no others.
void expectPaths(const PathStore& store, Strings expected) {
    EXPECT_EQ(iterated(store), expected);
    EXPECT_EQ(iterated(PathStore::load(store.save())), expected);
    Strings anyOrder = inTreeOrder(store);
    std::sort(anyOrder.begin(), anyOrder.end());
    std::sort(expected.begin(), expected.end());
    EXPECT_EQ(anyOrder, expected);
}

Strings basePaths() { return {"/a/b", "/a/c", "b/a", "/a/b", "c/", "/b/aa"}; }

// Files of old and new folders, repeats, and a name of many slabs' length.
Strings morePaths() {
    Strings paths = {"/a/cc", "b/c/a", "/a/b", "c/a/b/c", "a", "/c/c/c/"};
    for (std::size_t i = 0; i < 60; ++i)
        paths.push_back("/a/" + std::string(1 + i % 5, 'a') + "/" +
                        std::string(1 + i % 7, 'b'));
    paths.emplace_back(70'000, 'c');
    return paths;
}

// Every allocation of any thread counts; as there are thousands, each of the
// first hundred fails and then one of so many; with sanitizers far fewer.
constexpr support::AllocationCount onAllThreads(
    support::FailingAllocations allocations) {
    return {.threads = support::FailingThreads::All,
            .allocations = allocations,
            .allUpTo = support::shareOf(100),
            .step = 97 * (100 / support::shareOf(100)),
            .most = 100'000};
}

constexpr support::FailingAllocations eachKind[] = {
    support::FailingAllocations::AllLater, support::FailingAllocations::One};

// Enough for three threads that encode, in folders of a few files each.
Strings pathsForThreads() {
    Strings paths;
    for (std::size_t i = 0; i < 3200; ++i)
        paths.push_back("/a/" + std::string(1 + i / 9 % 40, 'b') + "/" +
                        std::string(1 + i % 9, 'c'));
    return paths;
}

void expectAppendedOrAsItWas(const Strings& more,
                             support::AllocationCount count = {}) {
    PathStore store;
    Strings all = basePaths();
    all.insert(all.end(), more.begin(), more.end());
    atEachAllocation([&] { store = PathStore::from(basePaths()); },
                     [&] { store.append(more); },
                     [&](bool succeeded) {
                         expectPaths(store, succeeded ? all : basePaths());
                         if (succeeded) return;
                         store.append(more);
                         expectPaths(store, all);
                     },
                     count);
}

TEST(PathStoreMemory, PathsAreAppendedOrTheStoreIsAsItWas) {
    expectAppendedOrAsItWas(morePaths());
}

TEST(PathStoreMemory, AStoreThatIsEncodedAnewIsSoOrAsItWas) {
    Strings more = morePaths();
    more.emplace_back("/a/another character");
    expectAppendedOrAsItWas(more);
}

TEST(PathStoreMemory, WhatThreadsEncodeIsAppendedOrTheStoreIsAsItWas) {
    for (const auto kind : eachKind)
        expectAppendedOrAsItWas(pathsForThreads(), onAllThreads(kind));
}

TEST(PathStoreMemory, WhatThreadsEncodeAnewIsSoOrTheStoreIsAsItWas) {
    Strings more = pathsForThreads();
    more.emplace_back("/a/another character");
    for (const auto kind : eachKind)
        expectAppendedOrAsItWas(more, onAllThreads(kind));
}

// The second chunk is encoded while the first one is inserted.
TEST(PathStoreMemory, ChunksAreAppendedOrTheStoreIsAsItWas) {
    const Strings more(250'002, "/a/b");
    PathStore store;
    for (const auto kind : eachKind)
        atEachAllocation([&] { store = PathStore::from(basePaths()); },
                         [&] { store.append(more); },
                         [&](bool succeeded) {
                             const std::size_t size = basePaths().size();
                             if (!succeeded) expectPaths(store, basePaths());
                             if (!succeeded) store.append(more);
                             ASSERT_EQ(store.size(), size + more.size());
                             EXPECT_EQ(store[size], more.front());
                             EXPECT_EQ(store[store.size() - 1], more.back());
                         },
                         {.threads = support::FailingThreads::All,
                          .allocations = kind,
                          .allUpTo = support::shareOf(10),
                          .step = 5 * (10 / support::shareOf(10))});
}

TEST(PathStoreMemory, SavingAndLoadingAreRepeatable) {
    const PathStore store = PathStore::from(morePaths());
    const auto bytes = store.save();
    atEachAllocation([] {}, [&] { EXPECT_EQ(store.save(), bytes); },
                     [](bool) {});
    atEachAllocation([] {},
                     [&] {
                         const PathStore loaded = PathStore::load(bytes);
                         EXPECT_EQ(loaded.size(), store.size());
                     },
                     [](bool) {});
    expectPaths(store, morePaths());
}

// A form of some windows is inflated on a thread of its own.
TEST(PathStoreMemory, LoadingWhileAThreadInflatesIsRepeatable) {
    std::mt19937 random(4);
    Strings paths;
    for (std::size_t i = 0; i < 8000; ++i) {
        std::string& path = paths.emplace_back("/d/");
        for (std::size_t length = 0; length < 200; ++length)
            path += static_cast<char>('a' + random() % 26);
    }
    const auto bytes = PathStore::from(paths).save();
    ASSERT_GT(bytes.size(), std::size_t{1} << 19U);
    for (const auto kind : eachKind)
        atEachAllocation([] {},
                         [&] {
                             const PathStore loaded = PathStore::load(bytes);
                             EXPECT_EQ(loaded.size(), paths.size());
                             EXPECT_EQ(loaded[7000], paths[7000]);
                         },
                         [](bool) {}, onAllThreads(kind));
    EXPECT_EQ(iterated(PathStore::load(bytes)), paths);
}

}  // namespace
