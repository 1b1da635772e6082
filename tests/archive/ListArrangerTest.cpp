#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>

#include "archive/ListArranger.hpp"

namespace tessel::archive {
namespace {

using Paths = std::vector<std::string>;

SegmentList listOf(const Paths& paths) {
    SegmentList list;
    for (const std::string& path : paths) list.add(SplitPath::of(path));
    return list;
}

Paths storedPaths(const SegmentList& list, const Arrangement& arrangement) {
    Paths paths;
    for (const NameRef& name : arrangement.names)
        paths.push_back(
            std::string(list.folders()[arrangement.listFolder(name.folder)]) +
            std::string(list.name(name)));
    return paths;
}

void expectFoldersByFirstAppearance(const Arrangement& arrangement) {
    std::uint32_t seen = 0;
    for (const NameRef& name : arrangement.names) {
        ASSERT_LE(name.folder, seen);
        seen = std::max(seen, name.folder + 1);
    }
}

// Sorts the list and compares with a plain sort that keeps equal paths in
// order.
void expectSorted(const Paths& paths) {
    const SegmentList list = listOf(paths);
    Workers workers(2, {});
    const Arrangement arrangement = arrangeSorted(list, workers);
    EXPECT_EQ(arrangement.order, ListOrder::Rearranged);
    std::vector<std::pair<std::string, std::uint32_t>> expected;
    for (std::uint32_t i = 0; i < paths.size(); ++i)
        expected.emplace_back(paths[i], i);
    std::ranges::sort(expected);
    const Paths stored = storedPaths(list, arrangement);
    ASSERT_EQ(stored.size(), paths.size());
    for (std::size_t i = 0; i < stored.size(); ++i) {
        ASSERT_EQ(stored[i], expected[i].first) << i;
        ASSERT_EQ(arrangement.numbers[i], expected[i].second) << i;
    }
    expectFoldersByFirstAppearance(arrangement);
}

TEST(ListArrangerTest, SortsByWholePaths) {
    expectSorted({"b", "a/b", "a", "a/", "a!", "a0/c", "a/b/c", "a/b!", "a/b",
                  "/", "//x", "a/b/c", "a/b!/d"});
}

TEST(ListArrangerTest, SortsRandomLists) {
    std::mt19937 random(11);
    for (int round = 0; round < 30; ++round) {
        Paths paths(400);
        for (std::string& path : paths) {
            path.assign(1, 'x');
            for (std::size_t i = random() % 14; i > 0; --i)
                path += "/ab!\xFF"[random() % 5];
        }
        expectSorted(paths);
    }
}

TEST(ListArrangerTest, SortsManyFoldersOnManyWorkers) {
    Paths paths;
    for (std::uint32_t i = 0; i < 5000; ++i) {
        std::string path = "folder";
        path += std::to_string(i * 7919 % 5000);
        path += "/a name longer than eight bytes ";
        path += std::to_string(i % 13);
        paths.push_back(path);
    }
    expectSorted(paths);
}

TEST(ListArrangerTest, SortedListsStay) {
    const SegmentList list = listOf({"a/b", "a/c", "a/c", "b"});
    Workers workers(1, {});
    const Arrangement arrangement = arrange(list, workers);
    EXPECT_EQ(arrangement.order, ListOrder::Sorted);
    EXPECT_TRUE(arrangement.numbers.empty());
    EXPECT_EQ(storedPaths(list, arrangement),
              (Paths{"a/b", "a/c", "a/c", "b"}));
}

TEST(ListArrangerTest, ListsInFolderRunsStay) {
    const Paths paths = {"b/2", "b/1", "b/3", "a/2", "a/1", "b/0"};
    const SegmentList list = listOf(paths);
    Workers workers(1, {});
    const Arrangement arrangement = arrange(list, workers);
    EXPECT_EQ(arrangement.order, ListOrder::AsGiven);
    EXPECT_EQ(storedPaths(list, arrangement), paths);
}

TEST(ListArrangerTest, ScatteredListsAreSorted) {
    Paths paths;
    for (int i = 0; i < 100; ++i) {
        std::string path(1, static_cast<char>('a' + i % 4));
        path += '/';
        paths.push_back(path + std::to_string(i));
    }
    const SegmentList list = listOf(paths);
    Workers workers(1, {});
    EXPECT_EQ(arrange(list, workers).order, ListOrder::Rearranged);
}

}  // namespace
}  // namespace tessel::archive
