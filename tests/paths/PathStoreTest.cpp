// The store as its users see it: strings in, the same strings out.

#include <gtest/gtest.h>
#include <rapidcheck.h>
#include <rapidcheck/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <list>
#include <ranges>
#include <sstream>
#include <string>
#include <system_error>
#include <thread>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "paths/IndexedRange.hpp"
#include "paths/PathStore.hpp"
#include "tests/paths/Stores.hpp"
#include "tests/support/TemporaryFolder.hpp"

namespace {

using stores::expectHolds;
using stores::inTreeOrder;
using stores::iterated;
using stores::readAll;
using stores::sorted;
using tessel::DamagedFormException;
using tessel::PathStore;
using tessel::paths::IndexedRange;
using Bytes = std::vector<std::uint8_t>;
using Numbers = std::vector<std::size_t>;
using Strings = std::vector<std::string>;
using namespace std::string_literals;

// Paths of every awkward kind: folders of each other, repeats, roots alone,
// runs of '/', NUL, newline, bytes that are no UTF-8.
const Strings& awkwardPaths() {
    static const Strings paths = {"/a/b",
                                  "/a/b/c",
                                  "/a",
                                  "/a/b",
                                  "a",
                                  "a",
                                  "a/",
                                  "a//",
                                  "a//b",
                                  "/",
                                  "//",
                                  "///x//",
                                  "name",
                                  "\0"s,
                                  "n\0/m\0"s,
                                  "line\nbreak",
                                  "\xFF\xFE/\xC3",
                                  "\xC3/\xA9",
                                  "gr\xC3\xBC\xC3\x9F"
                                  "e/\xE6\x97\xA5\xE6\x9C\xAC",
                                  "\xF0\x9F\x97\x82",
                                  "\xED\xB2\x80",
                                  "a/b/c/d/e/f/g",
                                  "/a/b/c"};
    return paths;
}

// ---- Adding and reading ----

TEST(PathStore, GivesBackWhatItWasMadeFrom) {
    expectHolds(PathStore::from(awkwardPaths()), awkwardPaths());
}

TEST(PathStore, HoldsNothingByDefault) {
    expectHolds(PathStore(), {});
    expectHolds(PathStore::from(Strings()), {});
    EXPECT_EQ(PathStore().coder().pathCount, 0U);
}

TEST(PathStore, ListsOfOneCharacterOrPathWork) {
    expectHolds(PathStore::from(Strings{"a"}), {"a"});
    expectHolds(PathStore::from(Strings{"a", "a", "aa"}), {"a", "a", "aa"});
    expectHolds(PathStore::from(Strings{"/"}), {"/"});
    expectHolds(PathStore::from(Strings{"///", "/"}), {"///", "/"});
    expectHolds(PathStore::from(Strings{"\0"s, "\0\0"s}), {"\0"s, "\0\0"s});
}

TEST(PathStore, TakesRangesOfEveryKind) {
    const Strings expected = {"a/b", "c"};
    const std::array<const char*, 2> literals = {"a/b", "c"};
    expectHolds(PathStore::from(literals), expected);
    expectHolds(PathStore::from(std::list<std::string>{"a/b", "c"}), expected);
    const std::vector<std::string_view> views = {"a/b", "c"};
    expectHolds(PathStore::from(views), expected);
    // Can be read only once.
    struct Words {
        std::istringstream text{"a/b c"};
        auto begin() { return std::istream_iterator<std::string>(text); }
        static auto end() { return std::istream_iterator<std::string>(); }
    };
    expectHolds(PathStore::from(Words()), expected);
    const IndexedRange made(
        0, views.size(), [&](std::size_t i) { return std::string(views[i]); });
    expectHolds(PathStore::from(made), expected);
}

TEST(PathStore, AppendedPathsFollow) {
    PathStore store;
    Strings expected;
    for (const std::string& path : awkwardPaths()) {
        store.append(path);
        expected.push_back(path);
        ASSERT_EQ(readAll(store), expected);
    }
    store.append(awkwardPaths());
    expected.insert(expected.end(), awkwardPaths().begin(),
                    awkwardPaths().end());
    store.append(Strings());
    expectHolds(store, expected);
}

TEST(PathStore, AppendsToALoadedStore) {
    PathStore store = PathStore::load(PathStore::from(awkwardPaths()).save());
    store.append(Strings{"/a/b/c/d", "\xE2\x82\xAC"});
    Strings expected = awkwardPaths();
    expected.insert(expected.end(), {"/a/b/c/d", "\xE2\x82\xAC"});
    expectHolds(store, expected);
}

TEST(PathStore, AppendsItself) {
    PathStore store = PathStore::from(Strings{"a/b", "c"});
    store.append(store);
    expectHolds(store, {"a/b", "c", "a/b", "c"});
}

TEST(PathStore, ANewCharacterKeepsNumbersAndOrder) {
    PathStore store = PathStore::from(Strings{"b/a", "a/b", "b/b"});
    store.append("a/c");
    EXPECT_EQ(readAll(store), (Strings{"b/a", "a/b", "b/b", "a/c"}));
    EXPECT_NE(store.coder().getTreeString().find(u'c'), std::u16string::npos);
}

TEST(PathStore, PathsWithoutNewCharactersKeepTheCode) {
    PathStore store = PathStore::from(Strings{"b/a", "a/b", "b/b"});
    const std::u16string code = store.coder().getTreeString();
    store.append(Strings{"a/a/a/a/aaaa"});
    EXPECT_EQ(store.coder().getTreeString(), code);
}

TEST(PathStore, ManyPathsOfSeveralChunksComeBack) {
    Strings paths;
    for (std::size_t i = 0; i < 230'000; ++i)
        paths.push_back("/top/" + std::to_string(i / 7 % 9'000) + "/file" +
                        std::to_string(i));
    const PathStore store = PathStore::from(paths);
    EXPECT_EQ(readAll(store), paths);
    EXPECT_EQ(iterated(store), paths);
}

TEST(PathStore, OneFileMayBeLongerThanAChunk) {
    const Strings paths = {std::string(20'000'000, 'x') + "/a", "b",
                           std::string(20'000'000, 'y')};
    EXPECT_EQ(readAll(PathStore::from(paths)), paths);
}

TEST(PathStore, DeepPathsComeBack) {
    std::string deep;
    for (int i = 0; i < 30'000; ++i) deep += "d/";
    const Strings paths = {deep + "a", deep, "d", deep + "d/b"};
    EXPECT_EQ(readAll(PathStore::from(paths)), paths);
}

TEST(PathStore, TreeOrderKeepsAFoldersFilesTogether) {
    const PathStore store =
        PathStore::from(Strings{"a/1", "b/1", "a/2", "b/2", "a/1"});
    EXPECT_EQ(inTreeOrder(store), (Strings{"a/1", "a/2", "a/1", "b/1", "b/2"}));
}

// ---- Reading by number ----

TEST(PathStore, ReadsRangesAndNumbersInAnyOrder) {
    const PathStore store = PathStore::from(awkwardPaths());
    const std::size_t size = store.size();
    const std::vector<Numbers> requests = {
        {}, {3}, {size - 1, 0}, {2, 2, 2}, {5, 4, 3, 4, 5, 0, size - 1, 1}};
    for (const Numbers& numbers : requests) {
        Numbers visited;
        store.read(numbers, [&](std::size_t number, std::string_view path) {
            visited.push_back(number);
            EXPECT_EQ(path, awkwardPaths()[number]);
        });
        EXPECT_EQ(visited, numbers);
    }
    Strings middle;
    store.read(2, 5, [&](std::size_t, std::string_view path) {
        middle.emplace_back(path);
    });
    EXPECT_EQ(middle,
              Strings(awkwardPaths().begin() + 2, awkwardPaths().begin() + 5));
}

TEST(PathStore, RefusesNumbersBeyondItsPathsBeforeTheFirstVisit) {
    const PathStore store = PathStore::from(Strings{"a", "b"});
    const auto never = [](std::size_t, std::string_view) { FAIL(); };
    EXPECT_THROW(store.read(0, 3, never), std::out_of_range);
    EXPECT_THROW(store.read(2, 1, never), std::out_of_range);
    EXPECT_THROW(store.read(3, 3, never), std::out_of_range);
    EXPECT_THROW(store.read(~std::size_t{0}, ~std::size_t{0}, never),
                 std::out_of_range);
    EXPECT_THROW(store.read(Numbers{0, 2}, never), std::out_of_range);
    EXPECT_NO_THROW(store.read(2, 2, never));
    std::string text = "kept";
    EXPECT_THROW(store.read(2, text), std::out_of_range);
    EXPECT_EQ(text, "kept");
    EXPECT_THROW(PathStore().read(0, text), std::out_of_range);
}

TEST(PathStore, ReadReplacesTheText) {
    const PathStore store = PathStore::from(Strings{"a/b", "longer/path"});
    std::string text = "before";
    store.read(1, text);
    EXPECT_EQ(text, "longer/path");
    store.read(0, text);
    EXPECT_EQ(text, "a/b");
}

TEST(PathStore, AVisitorsExceptionComesThrough) {
    const PathStore store = PathStore::from(awkwardPaths());
    const auto refuse = [](std::size_t, std::string_view) {
        throw std::out_of_range("mine");
    };
    try {
        store.read(0, 2, refuse);
        FAIL() << "nothing was thrown";
    } catch (const std::out_of_range& error) {
        EXPECT_STREQ(error.what(), "mine");
    }
}

TEST(PathStore, IteratorsMoveAndEndForGood) {
    PathStore store = PathStore::from(Strings{"a", "b"});
    auto first = store.begin();
    ++first;
    auto second = std::move(first);
    EXPECT_EQ(*second, "b");
    ++second;
    EXPECT_TRUE(second == store.end());
    second = store.begin();
    EXPECT_EQ(*second, "a");
    static_assert(std::ranges::input_range<PathStore>);
    EXPECT_EQ(std::ranges::distance(store.begin(), store.end()), 2);
}

TEST(PathStore, ALoopSeesWhatIsAppendedMeanwhile) {
    PathStore store = PathStore::from(Strings(40, "a/b"));
    std::size_t met = 0;
    for (const std::string_view path : store) {
        if (met++ == 0) store.append("c/\xC3\xA9");
        EXPECT_EQ(path, met <= 40 ? "a/b" : "c/\xC3\xA9");
    }
    EXPECT_EQ(met, 41U);
}

TEST(PathStore, SeveralThreadsReadOneStore) {
    Strings paths;
    for (int i = 0; i < 5'000; ++i)
        paths.push_back(std::to_string(i / 10) + "/f" + std::to_string(i));
    const PathStore store = PathStore::from(paths);
    std::array<bool, 4> same{};
    std::vector<std::thread> threads;
    for (bool& result : same)
        threads.emplace_back([&] {
            result = iterated(store) == paths && readAll(store) == paths;
        });
    for (std::thread& thread : threads) thread.join();
    for (const bool result : same) EXPECT_TRUE(result);
}

// ---- Life ----

TEST(PathStore, AMovedFromStoreIsEmptyAndUsable) {
    PathStore store = PathStore::from(Strings{"a", "b"});
    PathStore other = std::move(store);
    expectHolds(other, {"a", "b"});
    expectHolds(store, {});  // NOLINT(bugprone-use-after-move)
    store.append("c");
    expectHolds(store, {"c"});
    other = std::move(store);
    expectHolds(other, {"c"});
    PathStore& same = other;
    other = std::move(same);
    expectHolds(other, {"c"});
}

// ---- Refusals ----

std::string refusalOf(PathStore& store, const Strings& paths) {
    try {
        store.append(paths);
        return "";
    } catch (const std::invalid_argument& error) {
        return error.what();
    }
}

TEST(PathStore, AnEmptyPathIsRefusedWithItsPosition) {
    PathStore store = PathStore::from(Strings{"a"});
    EXPECT_EQ(refusalOf(store, {"b", "", "c"}),
              "The path at position 1 is empty.");
    EXPECT_EQ(refusalOf(store, {""}), "The path at position 0 is empty.");
    std::istringstream lines("b\n\nc");
    const auto read = [&] {
        return IndexedRange(0, 3, [&](std::size_t) {
            std::string line;
            std::getline(lines, line);
            return line;
        });
    };
    EXPECT_THROW(store.append(read()), std::invalid_argument);
    EXPECT_THROW(store.append(std::string_view()), std::invalid_argument);
    expectHolds(store, {"a"});
}

// A range whose second reading fails after some paths.
TEST(PathStore, ARangeThatThrowsLeavesTheStore) {
    for (const std::size_t failing : {0U, 10U, 150'000U, 250'000U}) {
        PathStore store = PathStore::from(Strings{"a/1", "0/2"});
        std::size_t seen = 0;
        const IndexedRange paths(0, 160'000, [&](std::size_t i) {
            if (seen++ == failing) throw std::length_error("enough");
            return std::string("a/").append(1 + i % 9, '0');
        });
        EXPECT_THROW(store.append(paths), std::length_error);
        expectHolds(store, {"a/1", "0/2"});
        store.append("a/3");
        expectHolds(store, {"a/1", "0/2", "a/3"});
    }
}

// ---- Saving ----

TEST(PathStore, SavedBytesAreReproducible) {
    const PathStore store = PathStore::from(awkwardPaths());
    const Bytes bytes = store.save();
    EXPECT_EQ(PathStore::load(bytes).save(), bytes);
    EXPECT_EQ(PathStore::from(awkwardPaths()).save(), bytes);
    // A pass leaves no trace in them.
    inTreeOrder(store);
    EXPECT_EQ(store.save(), bytes);
}

TEST(PathStore, FilesKeepAStore) {
    const support::TemporaryFolder folder;
    const std::string name = folder.file("store");
    PathStore::from(awkwardPaths()).saveFile(name);
    expectHolds(PathStore::loadFile(name), awkwardPaths());
    PathStore::from(Strings{"a"}).saveFile(name);
    expectHolds(PathStore::loadFile(name), {"a"});
    PathStore().saveFile(name);
    expectHolds(PathStore::loadFile(name), {});
    EXPECT_EQ(folder.entries(), 1U);
}

TEST(PathStore, FileErrorsNameTheFile) {
    const auto messageOf = [](auto operation) {
        try {
            operation();
        } catch (const std::system_error& error) {
            EXPECT_EQ(error.code(), std::errc::no_such_file_or_directory);
            return std::string(error.what());
        }
        return std::string();
    };
    EXPECT_NE(messageOf([] {
                  PathStore::loadFile("/no/file");
              }).find("Cannot read /no/file"),
              std::string::npos);
    EXPECT_NE(messageOf([] {
                  PathStore().saveFile("/no/file");
              }).find("Cannot write /no/file"),
              std::string::npos);
}

TEST(PathStore, ADamagedFileIsRefused) {
    const support::TemporaryFolder folder;
    std::ofstream(folder.file("bad")) << "no store";
    EXPECT_THROW(PathStore::loadFile(folder.file("bad")), DamagedFormException);
}

// ---- Inspection ----

TEST(PathStore, MemoryUsageGrowsWithThePaths) {
    const PathStore::MemoryUsage none = PathStore().memoryUsage();
    EXPECT_EQ(none.names + none.tree + none.numbers + none.encoding, 0U);
    PathStore store = PathStore::from(Strings{"some/path", "some/other"});
    const PathStore::MemoryUsage two = store.memoryUsage();
    EXPECT_EQ(two.total(),
              two.names + two.tree + two.numbers + two.encoding + two.other);
    store.append(Strings(1000, "some/path"));
    const PathStore::MemoryUsage many = store.memoryUsage();
    EXPECT_GT(many.names, two.names + 1000);
    EXPECT_GT(many.tree, two.tree);
    EXPECT_EQ(many.encoding, two.encoding);
}

TEST(PathStore, TheCoderIsThere) {
    const PathStore store = PathStore::from(Strings{"a", "b/c"});
    EXPECT_EQ(store.coder().pathCount, 2U);
}

// ---- Random histories ----

rc::Gen<std::string> anyPath() {
    const auto byte = rc::gen::weightedOneOf<char>(
        {{6, rc::gen::element('a', 'b', 'c')},
         {4, rc::gen::just('/')},
         {1, rc::gen::element('\0', '\n', '.', '\xC3', '\xA9', '\xED', '\xB2',
                              '\x80', '\xDC', '\xFF')},
         {1, rc::gen::arbitrary<char>()}});
    return rc::gen::nonEmpty(rc::gen::container<std::string>(byte));
}

RC_GTEST_PROP(PathStore, AnswersAsAPlainListDoes, ()) {
    PathStore store;
    Strings model;
    const auto steps = *rc::gen::inRange(1, 12);
    for (int step = 0; step < steps; ++step) {
        switch (*rc::gen::inRange(0, 5)) {
            case 0: {
                const auto path = *anyPath();
                store.append(path);
                model.push_back(path);
                break;
            }
            case 1: {
                const auto more = *rc::gen::container<Strings>(anyPath());
                store.append(more);
                model.insert(model.end(), more.begin(), more.end());
                break;
            }
            case 2:
                store = PathStore::load(store.save());
                break;
            case 3: {
                PathStore other = std::move(store);
                store = std::move(other);
                break;
            }
            default: {
                auto more = *rc::gen::container<Strings>(anyPath());
                more.emplace_back();
                RC_ASSERT_THROWS_AS(store.append(more), std::invalid_argument);
            }
        }
        RC_ASSERT(store.size() == model.size());
        RC_ASSERT(iterated(store) == model);
    }
    RC_ASSERT(readAll(store) == model);
    RC_ASSERT(sorted(inTreeOrder(store)) == sorted(model));
    if (model.empty()) return;
    const auto numbers = *rc::gen::container<Numbers>(
        rc::gen::inRange<std::size_t>(0, model.size()));
    std::size_t next = 0;
    store.read(numbers, [&](std::size_t number, std::string_view path) {
        RC_ASSERT(number == numbers[next++]);
        RC_ASSERT(path == model[number]);
    });
    RC_ASSERT(next == numbers.size());
}

}  // namespace
