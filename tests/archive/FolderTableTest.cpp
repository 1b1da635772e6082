#include <gtest/gtest.h>

#include <string>

#include "archive/FolderTable.hpp"

namespace tessel::archive {
namespace {

TEST(FolderTableTest, NumbersFoldersByFirstAppearance) {
    FolderTable table;
    EXPECT_EQ(table.numberOf("b/"), 0U);
    EXPECT_EQ(table.numberOf("a/"), 1U);
    EXPECT_EQ(table.numberOf(""), 2U);
    EXPECT_EQ(table.numberOf("b/"), 0U);
    EXPECT_EQ(table.size(), 3U);
    EXPECT_EQ(table[0], "b/");
    EXPECT_EQ(table[1], "a/");
    EXPECT_EQ(table[2], "");
}

TEST(FolderTableTest, GrowsAndStillFindsAll) {
    FolderTable table;
    for (int round = 0; round < 2; ++round)
        for (std::uint32_t i = 0; i < 20'000; ++i)
            ASSERT_EQ(table.numberOf("folder" + std::to_string(i) + "/"), i);
    EXPECT_EQ(table.size(), 20'000U);
    EXPECT_EQ(table[19'999], "folder19999/");
}

TEST(FolderTableTest, ClearForgetsAll) {
    FolderTable table;
    table.numberOf("a/");
    table.numberOf("b/");
    table.clear();
    EXPECT_EQ(table.size(), 0U);
    EXPECT_EQ(table.numberOf("b/"), 0U);
    EXPECT_EQ(table[0], "b/");
}

// A zero byte follows each folder, so that it can be coded as it lies.
TEST(FolderTableTest, FoldersEndWithAZeroByte) {
    FolderTable table;
    table.numberOf("a/");
    table.numberOf("bc/");
    EXPECT_EQ(table[0].data()[2], '\0');
    EXPECT_EQ(table[0].data() + 3, table[1].data());
}

}  // namespace
}  // namespace tessel::archive
