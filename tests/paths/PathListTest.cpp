// Lists of paths from files and folders.

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

namespace {

namespace fs = std::filesystem;
using namespace std::string_literals;
using tessel::paths::listFolder;
using tessel::paths::PathList;
using tessel::paths::PathListError;
using tessel::paths::readListFile;
using tessel::paths::readPaths;
using tessel::paths::walkFolder;
using tessel::paths::WalkFolders;
using tessel::paths::WalkReport;
using Strings = std::vector<std::string>;

Strings stringsOf(const PathList& list) {
    Strings strings;
    for (std::size_t i = 0; i < list.size(); ++i) strings.emplace_back(list[i]);
    return strings;
}

Strings fromText(const std::string& text) {
    return stringsOf(PathList::fromText(text, "list"));
}

// What reading throws, or "nothing".
template <class Read>
std::string messageOf(Read read) {
    try {
        read();
    } catch (const PathListError& error) {
        return error.what();
    }
    return "nothing";
}

// A folder of its own, removed at the end.
class PathListFiles : public testing::Test {
protected:
    PathListFiles() {
        std::string name = testing::TempDir() + "paths-XXXXXX";
        EXPECT_NE(::mkdtemp(name.data()), nullptr);
        top_ = name;
    }
    ~PathListFiles() override {
        std::error_code ignored;
        fs::remove_all(top_, ignored);
    }

    std::string write(const std::string& name, const std::string& text) const {
        const std::string file = top_ + "/" + name;
        std::ofstream(file, std::ios::binary) << text;
        return file;
    }
    void folder(const std::string& name) const {
        fs::create_directories(top_ + "/" + name);
    }

    std::string top_;
    WalkReport report_;
};

TEST(PathList, NewlinesSeparateAndTheLastMayBeLeftOut) {
    EXPECT_EQ(fromText("a/b\nc d\n"), (Strings{"a/b", "c d"}));
    EXPECT_EQ(fromText("a/b\nc d"), (Strings{"a/b", "c d"}));
    EXPECT_EQ(fromText("\r\n"), Strings{"\r"});
    EXPECT_EQ(fromText(""), Strings{});
}

TEST(PathList, WithANulOnlyNulsSeparate) {
    EXPECT_EQ(fromText("a\nb\0c\0"s), (Strings{"a\nb", "c"}));
    EXPECT_EQ(fromText("a\nb\0c\n"s), (Strings{"a\nb", "c\n"}));
}

TEST(PathList, AnEmptyPathIsRefusedWithItsLine) {
    EXPECT_EQ(messageOf([] { fromText("a\nb\n\nc\n"); }),
              "list, line 3: an empty path.");
    EXPECT_EQ(messageOf([] { fromText("\n"); }),
              "list, line 1: an empty path.");
    EXPECT_EQ(messageOf([] { fromText("a\0\0"s); }),
              "list, entry 2: an empty path.");
    EXPECT_THROW(PathList().append(""), std::invalid_argument);
}

TEST(PathList, CountsItsText) {
    PathList list = PathList::fromText("ab\nc", "list");
    EXPECT_EQ(list.textBytes(), 3U);
    list.append("/x\ny");
    EXPECT_EQ(list.textBytes(), 7U);
    EXPECT_EQ(stringsOf(list), (Strings{"ab", "c", "/x\ny"}));
}

TEST_F(PathListFiles, AFileIsReadWhole) {
    std::string text;
    Strings expected;
    for (int i = 0; i < 40'000; ++i) {
        expected.push_back("folder/" + std::to_string(i));
        text += expected.back() + '\n';
    }
    EXPECT_EQ(stringsOf(readListFile(write("list", text))), expected);
}

TEST_F(PathListFiles, APipeIsReadToItsEnd) {
    const std::string pipe = top_ + "/pipe";
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    const pid_t writer = ::fork();
    if (writer == 0) {
        std::ofstream(pipe) << "a\n" << std::string(200'000, 'b') << "\n";
        ::_exit(0);
    }
    EXPECT_EQ(stringsOf(readPaths(pipe, report_)),
              (Strings{"a", std::string(200'000, 'b')}));
}

TEST_F(PathListFiles, WhatCannotBeReadIsNamed) {
    EXPECT_EQ(messageOf([&] { readPaths(top_ + "/no", report_); }),
              "Cannot read " + top_ + "/no: No such file or directory.");
    EXPECT_EQ(messageOf([&] { readListFile(top_); }),
              "Cannot read " + top_ + ": Is a directory.");
    EXPECT_EQ(messageOf([&] { listFolder(top_ + "/no", report_); }),
              "Cannot read " + top_ + "/no: No such file or directory.");
}

TEST_F(PathListFiles, AListWithoutPathsIsRefused) {
    const std::string file = write("list", "");
    EXPECT_EQ(messageOf([&] { readPaths(file, report_); }),
              file + " holds no paths.");
    folder("empty");
    EXPECT_EQ(messageOf([&] { readPaths(top_ + "/empty", report_); }),
              top_ + "/empty holds no paths.");
}

TEST_F(PathListFiles, AWalkListsFilesFirstAndThenFoldersInOrder) {
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

TEST_F(PathListFiles, AWalkListsLinksAndDoesNotFollowThem) {
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

TEST_F(PathListFiles, AWalkShowsFoldersBeforeWhatIsInThemIfAsked) {
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

TEST_F(PathListFiles, AWalkGoesDeeperThanTheLongestNameOfTheSystem) {
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

TEST_F(PathListFiles, AFolderThatCannotBeReadIsCountedAndLeftOut) {
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
