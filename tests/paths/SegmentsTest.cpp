// Where a store cuts its paths.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "paths/Segments.hpp"

namespace {

using namespace tessel::paths;

// The segments of a path, the file's last, with '|' between them.
std::string segmentsOf(std::string_view path) {
    const std::size_t cut = fileStartOf(path);
    std::string all;
    forEachSegment(path.substr(0, cut), [&](std::string_view segment) {
        all.append(segment).push_back('|');
    });
    return all.append(path.substr(cut));
}

TEST(Segments, FoldersKeepTheirSlashes) {
    EXPECT_EQ(segmentsOf("/a/b"), "/|a/|b");
    EXPECT_EQ(segmentsOf("a/b/c"), "a/|b/|c");
    EXPECT_EQ(segmentsOf("a//b"), "a//|b");
    EXPECT_EQ(segmentsOf("///a"), "///|a");
    EXPECT_EQ(segmentsOf("a/"), "a/|");
    EXPECT_EQ(segmentsOf("a//"), "a//|");
    EXPECT_EQ(segmentsOf("/"), "/|");
    EXPECT_EQ(segmentsOf("name"), "name");
}

TEST(Segments, APathHasTheFoldersUpToItsLastSlash) {
    const std::vector<std::string> paths = {
        "name", "a/", "a/b", "a//", "a//b", "a/b/", "a/b/c", "/", "/a", "ab/c",
    };
    const std::vector<std::string> folders = {
        "", "a/", "a//", "a/b/", "/", "ab/", "a", "b/",
    };
    for (const std::string& path : paths)
        for (const std::string& folder : folders)
            EXPECT_EQ(hasFolders(path, folder),
                      path.substr(0, fileStartOf(path)) == folder)
                << path << " in " << folder;
}

TEST(Segments, NamesThatAreNotThereAddNothing) {
    std::string bytes = "a/";
    EXPECT_TRUE(appendSegment(std::u16string(1, noName), bytes));
    EXPECT_EQ(bytes, "a/");
    EXPECT_TRUE(appendSegment(u"b", bytes));
    EXPECT_EQ(bytes, "a/b");
}

TEST(Segments, OtherTextsOfNoBytesAreRefused) {
    std::string bytes = "kept";
    EXPECT_FALSE(appendSegment(std::u16string(2, noName), bytes));
    EXPECT_FALSE(appendSegment(std::u16string(u"a") + noName, bytes));
    EXPECT_FALSE(appendSegment(std::u16string(1, 0xD800), bytes));
    EXPECT_EQ(bytes, "kept");
}

}  // namespace
