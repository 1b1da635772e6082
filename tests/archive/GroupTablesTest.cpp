#include <gtest/gtest.h>

#include <stdexcept>

#include "archive/GroupTables.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

Blocks blocksOf(std::vector<std::uint32_t> lengths,
                std::vector<std::uint8_t> newFolders = {}) {
    return {{}, std::move(lengths), std::move(newFolders)};
}

TEST(GroupTablesTest, AGroupOfNamesHasFortyBytes) {
    const auto tables = packGroups({blocksOf({10, 20}, {3, 4})}, {});
    Bytes expected(nameGroupBytes);
    expected[8] = 3;
    expected[9] = 4;
    expected[24] = 10;
    expected[25] = 20;
    EXPECT_EQ(tables.names, expected);
    EXPECT_TRUE(tables.folders.empty());
    EXPECT_TRUE(tables.wide.empty());
}

TEST(GroupTablesTest, OffsetsAndFoldersRunOnOverGroupsAndChunks) {
    const auto chunk = blocksOf(std::vector<std::uint32_t>(32, 200),
                                std::vector<std::uint8_t>(32, 16));
    const auto tables = packGroups({chunk, blocksOf({1}, {1})}, {chunk});
    ASSERT_EQ(tables.names.size(), 3 * nameGroupBytes);
    ASSERT_EQ(tables.folders.size(), 2 * folderGroupBytes);
    const auto uint32At = [](const Bytes& bytes, std::size_t at) {
        return bytes[at] | static_cast<std::uint32_t>(bytes[at + 1]) << 8U |
               static_cast<std::uint32_t>(bytes[at + 2]) << 16U |
               static_cast<std::uint32_t>(bytes[at + 3]) << 24U;
    };
    EXPECT_EQ(uint32At(tables.names, nameGroupBytes), 16U * 200);
    EXPECT_EQ(uint32At(tables.names, nameGroupBytes + 4), 16U * 16);
    EXPECT_EQ(uint32At(tables.names, 2 * nameGroupBytes), 32U * 200);
    EXPECT_EQ(uint32At(tables.names, 2 * nameGroupBytes + 4), 32U * 16);
    EXPECT_EQ(uint32At(tables.folders, folderGroupBytes), 16U * 200);
}

TEST(GroupTablesTest, LongBlocksMakeTheirGroupWide) {
    const auto tables =
        packGroups({blocksOf({255}, {1})}, {blocksOf({7, 256, 70'000})});
    EXPECT_EQ(tables.names[24], 255);
    EXPECT_EQ(tables.names[3] & 0x80, 0);
    Bytes expected(folderGroupBytes);
    expected[3] = 0x80;
    EXPECT_EQ(tables.folders, expected);
    ASSERT_EQ(tables.wide.size(), wideGroupBytes);
    EXPECT_EQ((Bytes{tables.wide.begin(), tables.wide.begin() + 12}),
              (Bytes{7, 0, 0, 0, 0, 1, 0, 0, 0x70, 0x11, 1, 0}));
}

TEST(GroupTablesTest, WideGroupsAreNumberedOverBothSections) {
    const auto wide = blocksOf({300}, {1});
    const auto tables = packGroups({wide}, {wide});
    EXPECT_EQ(tables.names[24], 0);
    EXPECT_EQ(tables.folders[4], 1);
    EXPECT_EQ(tables.wide.size(), 2 * wideGroupBytes);
}

TEST(GroupTablesTest, OffsetsBelowTwoGibibytesOnly) {
    const auto huge = blocksOf(
        std::vector<std::uint32_t>(blocksPerGroup, std::uint32_t{1} << 27));
    EXPECT_THROW(packGroups({}, {huge, huge}), std::length_error);
}

}  // namespace
}  // namespace tessel::archive
