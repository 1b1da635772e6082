#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>

#include "archive/GivenOrderSearch.hpp"
#include "archive/IndexedSearch.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

TEST(IndexedSearch, AgreesWithTheSearchWithoutIndex) {
    const auto list = archives::inFolderRuns(3000);
    ArchiveOptions options;
    options.index = ArchiveIndex::WhereNeeded;
    const archives::OpenArchive indexed(list, options);
    const archives::OpenArchive plain(list);
    ASSERT_EQ(indexed.segment().head().order, ListOrder::AsGiven);
    ASSERT_GT(indexed.segment().bytesOf(Section::Index), 0U);
    IndexedSearch byIndex(indexed.segment());
    GivenOrderSearch byScan(plain.segment());
    for (std::size_t i = 0; i < list.size(); i += 23) {
        const auto first = std::ranges::find(list, list[i]) - list.begin();
        EXPECT_EQ(byIndex.find(list[i]), static_cast<std::uint64_t>(first));
        EXPECT_EQ(byScan.find(list[i]), static_cast<std::uint64_t>(first));
        EXPECT_EQ(byIndex.find(list[i] + "x"), list.size());
        EXPECT_EQ(byScan.find(list[i] + "x"), list.size());
    }
    for (const std::string prefix : {"home/", "home/7/", "home/7/x/", "no/"})
        EXPECT_EQ(byIndex.startingWith(prefix), byScan.startingWith(prefix))
            << prefix;
}

}  // namespace
}  // namespace tessel::archive
