// Lists of paths from folders.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "paths/PathList.hpp"
#include "tests/paths/Lists.hpp"

namespace {

namespace fs = std::filesystem;
using support::stringsOf;
using tessel::paths::listFolder;
using tessel::paths::PathList;
using tessel::paths::walkFolder;
using tessel::paths::WalkFolders;
using tessel::paths::WalkReport;
using Strings = std::vector<std::string>;

// A folder of its own, removed at the end.
class FolderWalk : public testing::Test {
protected:
    FolderWalk() {
        std::string name = testing::TempDir() + "paths-XXXXXX";
        EXPECT_NE(::mkdtemp(name.data()), nullptr);
        top_ = name;
    }
    ~FolderWalk() override {
        std::error_code ignored;
        fs::remove_all(top_, ignored);
    }

    void write(const std::string& name, const std::string& text) const {
        std::ofstream(top_ + "/" + name, std::ios::binary) << text;
    }
    void folder(const std::string& name) const {
        fs::create_directories(top_ + "/" + name);
    }

    std::string top_;
    WalkReport report_;
};

TEST_F(FolderWalk, AWalkListsFilesFirstAndThenFoldersInOrder) {
    folder("b/inner");
    folder("a");
    folder("empty");
    write("z", "");
    write("B", "");
    write("b/y", "");
    write("b/inner/x", "");
    write("a/2", "");
    write("a/10", "");
    EXPECT_EQ(stringsOf(listFolder(top_, report_)),
              (Strings{top_ + "/B", top_ + "/z", top_ + "/a/10", top_ + "/a/2",
                       top_ + "/b/y", top_ + "/b/inner/x"}));
    EXPECT_EQ(report_.foldersRead, 5U);
    EXPECT_EQ(report_.foldersSkipped, 0U);
    EXPECT_EQ(stringsOf(listFolder(top_ + "/a/", report_)),
              (Strings{top_ + "/a/10", top_ + "/a/2"}))
        << "the name's own '/' is enough";
}

TEST_F(FolderWalk, AWalkListsLinksAndDoesNotFollowThem) {
    folder("real");
    write("real/file", "");
    fs::create_directory_symlink("real", top_ + "/linked");
    fs::create_symlink("nowhere", top_ + "/broken");
    fs::create_directory_symlink("..", top_ + "/real/round");
    EXPECT_EQ(stringsOf(listFolder(top_, report_)),
              (Strings{top_ + "/broken", top_ + "/linked", top_ + "/real/file",
                       top_ + "/real/round"}));
    EXPECT_EQ(stringsOf(listFolder(top_ + "/linked", report_)),
              (Strings{top_ + "/linked/file", top_ + "/linked/round"}))
        << "the given name itself may be a link";
}

TEST_F(FolderWalk, AWalkShowsFoldersBeforeWhatIsInThemIfAsked) {
    folder("b/inner");
    folder("a");
    write("b/x", "");
    write("b/inner/y", "");
    write("z", "");
    std::vector<std::string> shown;
    walkFolder(top_, WalkFolders::Show, report_,
               [&](std::string_view path) { shown.emplace_back(path); });
    EXPECT_EQ(shown, (std::vector<std::string>{
                         top_ + "/z", top_ + "/a", top_ + "/b", top_ + "/b/x",
                         top_ + "/b/inner", top_ + "/b/inner/y"}));
}

TEST_F(FolderWalk, AWalkGoesDeeperThanTheLongestNameOfTheSystem) {
    const std::string name(250, 'n');
    std::string expected = top_;
    int at = ::open(top_.c_str(), O_PATH | O_DIRECTORY);
    for (int depth = 0; depth < 40; ++depth) {
        ASSERT_EQ(::mkdirat(at, name.c_str(), 0700), 0);
        const int next = ::openat(at, name.c_str(), O_PATH | O_DIRECTORY);
        ASSERT_GE(next, 0);
        ::close(at);
        at = next;
        expected.append("/").append(name);
    }
    const int made = ::openat(at, "leaf", O_CREAT | O_WRONLY, 0600);
    ASSERT_GE(made, 0);
    ::close(made);
    ::close(at);
    EXPECT_EQ(stringsOf(listFolder(top_, report_)),
              std::vector<std::string>{expected + "/leaf"});
    EXPECT_EQ(report_.foldersSkipped, 0U);
}

TEST_F(FolderWalk, AFolderThatCannotBeReadIsCountedAndLeftOut) {
    // A folder that goes away meanwhile, since root may read all others.
    folder("gone");
    folder("kept");
    write("first", "");
    write("kept/last", "");
    Strings shown;
    walkFolder(top_, WalkFolders::Leave, report_, [&](std::string_view path) {
        shown.emplace_back(path);
        fs::remove(top_ + "/gone");
    });
    EXPECT_EQ(shown, (Strings{top_ + "/first", top_ + "/kept/last"}));
    EXPECT_EQ(report_.foldersRead, 2U);
    EXPECT_EQ(report_.foldersSkipped, 1U);
    EXPECT_EQ(report_.firstSkipped, top_ + "/gone");
    EXPECT_EQ(report_.firstReason, "No such file or directory");
}

}  // namespace
