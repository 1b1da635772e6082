#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "archive/NumberLookup.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

std::optional<std::uint64_t> expectedNumber(const Paths& list,
                                            const std::string& path) {
    const auto found = std::ranges::find(list, path);
    if (found == list.end()) return std::nullopt;
    return static_cast<std::uint64_t>(found - list.begin());
}

// Asks for what is there, what is not and every folder.
void expectRightNumbers(const Paths& list, const ArchiveOptions& options) {
    const OpenArchive archive(list, options);
    Paths folders = {"", "no"};
    for (const std::string& path : list) {
        EXPECT_EQ(numberOf(archive.reader(), path), expectedNumber(list, path));
        EXPECT_TRUE(contains(archive.reader(), path));
        EXPECT_FALSE(contains(archive.reader(), path + '!'));
        EXPECT_EQ(numberOf(archive.reader(), path + '!'), std::nullopt);
        folders.push_back(path.substr(0, path.rfind('/') + 1));
    }
    for (const std::string& folder : folders)
        EXPECT_EQ(numbersBelow(archive.reader(), folder),
                  archives::rangesBelow(list, prefixOf(folder)))
            << folder;
}

// Fifty paths, each third one twice, in segments of twenty.
void expectRightNumbersInAnyOrder(ArchiveIndex index) {
    Paths sorted = archives::sortedPaths(40);
    for (std::size_t i = 0; i < 40; i += 4) sorted.push_back(sorted[i]);
    std::ranges::sort(sorted);
    ArchiveOptions options = archives::segmentsOf(20);
    options.index = index;
    expectRightNumbers(sorted, options);
    expectRightNumbers(archives::shuffled(sorted), options);
    expectRightNumbers(archives::scatteredPaths(50), options);
    expectRightNumbers(archives::inFolderRuns(50), options);
}

TEST(NumberLookup, FindsNumbersInAnyOrder) {
    expectRightNumbersInAnyOrder(ArchiveIndex::None);
}

TEST(NumberLookup, FindsNumbersByAnIndex) {
    expectRightNumbersInAnyOrder(ArchiveIndex::WhereNeeded);
}

TEST(NumberLookup, FolderEndsWithOneSeparator) {
    EXPECT_EQ(prefixOf(""), "");
    EXPECT_EQ(prefixOf("a"), "a/");
    EXPECT_EQ(prefixOf("a/"), "a/");
    EXPECT_EQ(prefixOf("a//"), "a//");
    EXPECT_EQ(prefixOf("/"), "/");
}

TEST(NumberLookup, PlacesBelowAFolderAreOneRangeOfASortedList) {
    const OpenArchive archive({"a", "a-b/x", "a/b/c", "a/d", "a0", "b/a/x"});
    using Ranges = std::vector<NumberRange>;
    EXPECT_EQ(placesBelow(archive.segment(), ""), (Ranges{{0, 6}}));
    EXPECT_EQ(placesBelow(archive.segment(), "a/"), (Ranges{{2, 4}}));
    EXPECT_EQ(placesBelow(archive.segment(), "a/b/"), (Ranges{{2, 3}}));
    EXPECT_EQ(numbersBelow(archive.reader(), "z"), Ranges{});
}

}  // namespace
}  // namespace tessel::archive
