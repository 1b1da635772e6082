#include <gtest/gtest.h>

#include <string_view>
#include <vector>

#include "archive/TextFilter.hpp"

namespace tessel::archive {
namespace {

using Texts = std::vector<std::string_view>;

bool takes(TextFilter filter, std::string_view folder, std::string_view path) {
    filter.enterFolder(folder);
    return filter.takesWholeFolder() || filter.takes(path);
}

TEST(TextFilter, AllTextsMustBeThere) {
    const TextFilter filter(Texts{"lib", "so"});
    EXPECT_TRUE(takes(filter, "usr/lib/", "usr/lib/a.so"));
    EXPECT_FALSE(takes(filter, "usr/lib/", "usr/lib/a.a"));
    EXPECT_FALSE(takes(filter, "usr/bin/", "usr/bin/so"));
}

TEST(TextFilter, ATextMayReachFromTheFolderIntoTheName) {
    EXPECT_TRUE(takes(TextFilter(Texts{"r/lib/a"}), "usr/lib/", "usr/lib/ab"));
    EXPECT_TRUE(
        takes(TextFilter(Texts{"usr/lib/ab"}), "usr/lib/", "usr/lib/ab"));
    EXPECT_FALSE(takes(TextFilter(Texts{"r/lib/b"}), "usr/lib/", "usr/lib/ab"));
}

TEST(TextFilter, AFolderWithAllTextsIsTakenAsAWhole) {
    TextFilter filter(Texts{"usr", "lib"});
    filter.enterFolder("usr/lib/");
    EXPECT_TRUE(filter.takesWholeFolder());
    filter.enterFolder("usr/bin/");
    EXPECT_FALSE(filter.takesWholeFolder());
}

TEST(TextFilter, NoTextsAndEmptyTextsTakeAll) {
    EXPECT_TRUE(takes(TextFilter(Texts{}), "", "a"));
    EXPECT_TRUE(takes(TextFilter(Texts{"", ""}), "", "a"));
}

TEST(TextFilter, CopiesAreIndependent) {
    TextFilter first(Texts{"lib"});
    TextFilter second = first;
    first.enterFolder("lib/");
    second.enterFolder("bin/");
    EXPECT_TRUE(first.takesWholeFolder());
    EXPECT_FALSE(second.takesWholeFolder());
    EXPECT_TRUE(second.takes("bin/lib"));
}

}  // namespace
}  // namespace tessel::archive
