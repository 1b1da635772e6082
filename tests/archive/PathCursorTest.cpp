#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "archive/PathCursor.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;

TEST(PathCursor, GoesAnywhereInAnyOrder) {
    const auto list = archives::sortedPaths(1000);
    const OpenArchive archive(list);
    PathCursor paths(archive.segment());
    for (std::uint64_t i = 0; i < 3000; ++i) {
        const std::uint64_t place = i * i * 31 % list.size();
        ASSERT_EQ(paths.at(place), list[place]);
        ASSERT_EQ(paths.at(place), list[place]) << "again";
    }
}

TEST(PathCursor, TellsFolderAndName) {
    const auto list = archives::sortedPaths(200);
    const OpenArchive archive(list);
    PathCursor paths(archive.segment());
    for (std::uint64_t place = 0; place < list.size(); ++place) {
        paths.seek(place);
        const std::size_t name = list[place].rfind('/') + 1;
        EXPECT_EQ(paths.name(), list[place].substr(name));
        EXPECT_EQ(paths.folder(), list[place].substr(0, name));
        EXPECT_EQ(paths.isAtBlockEnd(),
                  place % 16 == 15 || place + 1 == list.size());
    }
}

TEST(PathCursor, NumbersFoldersAsTheyComeFirst) {
    const OpenArchive archive({"a/1", "b/1", "b/2", "c/1"});
    PathCursor paths(archive.segment());
    constexpr std::uint32_t folders[] = {0, 1, 1, 2};
    for (std::uint64_t place = 0; place < 4; ++place) {
        paths.seek(place);
        EXPECT_EQ(paths.folderNumber(), folders[place]);
        EXPECT_EQ(paths.foldersSeen(), folders[place] + 1);
    }
}

TEST(PathCursor, HoldsPathsThatDoNotFitInItself) {
    const archives::Paths list = {std::string(100'000, 'a') + "/x",
                                  std::string(100'000, 'b')};
    const OpenArchive archive(list);
    PathCursor paths(archive.segment());
    EXPECT_EQ(paths.at(1), list[1]);
    EXPECT_EQ(paths.at(0), list[0]);
}

}  // namespace
}  // namespace tessel::archive
