#include <gtest/gtest.h>

#include <string>

#include "archive/SegmentList.hpp"

namespace tessel::archive {
namespace {

SegmentList segmentListOf(const std::vector<std::string>& paths) {
    SegmentList list;
    for (const std::string& path : paths) list.add(SplitPath::of(path));
    return list;
}

TEST(SegmentListTest, PathsAreSplitAfterTheLastSlash) {
    EXPECT_EQ(SplitPath::of("a/b/c"), (SplitPath{"a/b/", "c"}));
    EXPECT_EQ(SplitPath::of("abc"), (SplitPath{"", "abc"}));
    EXPECT_EQ(SplitPath::of("a/"), (SplitPath{"a/", ""}));
    EXPECT_EQ(SplitPath::of("/"), (SplitPath{"/", ""}));
}

// All pairs of awkward neighbours.
TEST(SegmentListTest, SplitPathsCompareLikeWholeOnes) {
    const std::vector<std::string> paths = {
        "a",    "a/",   "a//",  "a/a",     "a/b", "a/b/c", "a!", "a!/b",
        "a0/b", "a/b!", "a/bc", "a/b\xFF", "b",   "\xFF/", "/",  "//"};
    for (const std::string& a : paths)
        for (const std::string& b : paths)
            EXPECT_EQ(SplitPath::of(a) <=> SplitPath::of(b), a <=> b)
                << a << " and " << b;
}

TEST(SegmentListTest, KeepsFoldersOnceAndNamesInOrder) {
    const SegmentList list = segmentListOf({"a/x", "a/yy", "b", "a/", "a/x"});
    ASSERT_EQ(list.size(), 5U);
    EXPECT_EQ(list.folders().size(), 2U);
    std::string all;
    for (const NameRef& ref : list.names()) {
        all += list.folders()[ref.folder];
        all += list.name(ref);
        EXPECT_EQ(list.text()[ref.start + ref.length], '\0');
        all += '|';
    }
    EXPECT_EQ(all, "a/x|a/yy|b|a/|a/x|");
    EXPECT_EQ(list.textBytes(), 3U + 4 + 1 + 2 + 3);
}

TEST(SegmentListTest, KnowsWhetherItIsSorted) {
    EXPECT_TRUE(segmentListOf({}).sorted());
    EXPECT_TRUE(segmentListOf({"a", "a", "a/b", "a/b", "a0"}).sorted());
    EXPECT_FALSE(segmentListOf({"a/b", "a/a"}).sorted());
    EXPECT_FALSE(segmentListOf({"a/b", "a"}).sorted());
    EXPECT_FALSE(segmentListOf({"a0", "a/b", "b"}).sorted());
}

TEST(SegmentListTest, ClearStartsAnew) {
    SegmentList list = segmentListOf({"b/x", "a/x"});
    list.clear();
    EXPECT_EQ(list.size(), 0U);
    EXPECT_EQ(list.textBytes(), 0U);
    EXPECT_TRUE(list.sorted());
    list.add(SplitPath::of("c/y"));
    EXPECT_EQ(list.folders()[0], "c/");
    EXPECT_EQ(list.name(list.names()[0]), "y");
}

}  // namespace
}  // namespace tessel::archive
