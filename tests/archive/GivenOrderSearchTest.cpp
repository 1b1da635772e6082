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

// Asks for the first place of each path of a list in no order.
void expectFirstPlaces(const Paths& list) {
    const OpenArchive archive(list);
    ASSERT_EQ(archive.segment().head().order, ListOrder::AsGiven);
    GivenOrderSearch search(archive.segment());
    for (const std::string& path : list)
        EXPECT_EQ(search.find(path),
                  static_cast<std::uint64_t>(std::ranges::find(list, path) -
                                             list.begin()))
            << path;
}

TEST(GivenOrderSearch, FindsTheFirstPlace) { expectFirstPlaces(someList()); }

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
        EXPECT_EQ(search.startingWith(prefix),
                  archives::rangesBelow(list, prefix))
            << prefix;
}

// More blocks of names than one, so that the search for the first one counts.
TEST(GivenOrderSearch, FindsFoldersThatStartInLaterBlocks) {
    expectFirstPlaces(archives::inFolderRuns(150));
}

}  // namespace
}  // namespace tessel::archive
