// A reader in another language, written from docs/archive-format.md alone,
// reads what the writer writes.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <string>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "tests/archive/ArchiveLists.hpp"

namespace {

using support::Paths;

struct Answer {
    Paths paths;
    int status = 0;
};

// Runs plain_reader.py on the bytes.
Answer readPlainly(const std::vector<std::uint8_t>& bytes) {
    // One file per test: tests run side by side.
    const std::string file =
        testing::TempDir() + "plain-reader-" +
        testing::UnitTest::GetInstance()->current_test_info()->name();
    std::ofstream(file, std::ios::binary)
        .write(reinterpret_cast<const char*>(bytes.data()),
               static_cast<std::streamsize>(bytes.size()));
    const std::string command = "/usr/bin/python3 -B " QZTESSEL_PLAIN_READER
                                " '" +
                                file + "' 2>/dev/null";
    std::FILE* pipe = popen(command.c_str(), "r");
    std::string text;
    for (int c = 0; (c = std::fgetc(pipe)) != EOF;)
        text.push_back(static_cast<char>(c));
    Answer answer;
    answer.status = pclose(pipe);
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = text.find('\0', begin);
        answer.paths.push_back(text.substr(begin, end - begin));
        begin = end + 1;
    }
    return answer;
}

}  // namespace

TEST(PlainReader, ReadsEveryNastyList) {
    for (const auto& [name, paths] : support::nastyLists()) {
        SCOPED_TRACE(name);
        const Answer answer = readPlainly(support::archiveOf(paths));
        EXPECT_EQ(answer.status, 0);
        EXPECT_EQ(answer.paths, paths);
    }
}

TEST(PlainReader, ReadsSegmentsAndIndexes) {
    tessel::ArchiveOptions options;
    options.pathsPerSegment = 900;
    options.index = tessel::ArchiveIndex::WhereNeeded;
    for (const auto& [name, paths] : support::nastyLists()) {
        SCOPED_TRACE(name);
        const Answer answer = readPlainly(support::archiveOf(paths, options));
        EXPECT_EQ(answer.status, 0);
        EXPECT_EQ(answer.paths, paths);
    }
}

TEST(PlainReader, RefusesAFlippedByte) {
    std::vector<std::uint8_t> bytes =
        support::archiveOf(support::fileList(200, 1));
    bytes[bytes.size() / 2] ^= 1;
    const Answer answer = readPlainly(bytes);
    EXPECT_NE(answer.status, 0);
    EXPECT_TRUE(answer.paths.empty());
}
