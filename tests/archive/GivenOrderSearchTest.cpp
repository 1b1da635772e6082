#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "archive/GivenOrderSearch.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

// Folders in no order, one of them twice; a path twice.
Paths someList() {
    return {"z/b", "z/a",   "m/",    "m/n/x", "m/n/y", "a",
            "z/b", "m/n/x", "q/z/b", "q/z/c", "z/q",   "b"};
}

std::vector<NumberRange> expectedBelow(const Paths& list,
                                       const std::string& prefix) {
    std::vector<NumberRange> ranges;
    for (std::uint64_t i = 0; i < list.size(); ++i)
        if (list[i].starts_with(prefix)) appendRange(ranges, {i, i + 1});
    return ranges;
}

TEST(GivenOrderSearch, FindsTheFirstPlace) {
    const Paths list = someList();
    const OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::AsGiven);
    GivenOrderSearch search(archive.segment());
    for (const std::string& path : list)
        EXPECT_EQ(search.find(path),
                  static_cast<std::uint64_t>(std::ranges::find(list, path) -
                                             list.begin()))
            << path;
}

TEST(GivenOrderSearch, DoesNotFindWhatIsNotThere) {
    const Paths list = someList();
    const OpenArchive archive(list);
    GivenOrderSearch search(archive.segment());
    for (const std::string path : {"", "c", "z/", "z/c", "m/n/", "m", "n/x"})
        EXPECT_EQ(search.find(path), list.size()) << path;
}

TEST(GivenOrderSearch, FindsAllPlacesBelowAFolder) {
    const Paths list = someList();
    const OpenArchive archive(list);
    GivenOrderSearch search(archive.segment());
    for (const std::string prefix : {"", "z/", "m/", "m/n/", "q/", "no/"})
        EXPECT_EQ(search.startingWith(prefix), expectedBelow(list, prefix))
            << prefix;
}

// More blocks of names than one, so that the search for the first one counts.
TEST(GivenOrderSearch, FindsFoldersThatStartInLaterBlocks) {
    const Paths list = archives::inFolderRuns(150);
    const OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::AsGiven);
    GivenOrderSearch search(archive.segment());
    for (const std::string& path : list)
        EXPECT_EQ(search.find(path),
                  static_cast<std::uint64_t>(std::ranges::find(list, path) -
                                             list.begin()))
            << path;
}

}  // namespace
}  // namespace tessel::archive
