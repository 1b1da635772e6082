// Lists of paths from files.

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
using namespace std::string_literals;
using tessel::paths::listFolder;
using tessel::paths::PathList;
using tessel::paths::PathListError;
using tessel::paths::readListFile;
using tessel::paths::readPaths;
using tessel::paths::WalkReport;
using Strings = std::vector<std::string>;

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

}  // namespace
