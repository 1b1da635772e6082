// Files are read and replaced as a whole.

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <filesystem>
#include <fstream>
#include <string>
#include <system_error>
#include <vector>

#include "paths/WholeFile.hpp"
#include "tests/support/TemporaryFolder.hpp"

namespace {

namespace fs = std::filesystem;
using tessel::paths::readWholeFile;
using tessel::paths::replaceFile;
using Bytes = std::vector<std::uint8_t>;

void replaceByN(const std::string& file) { replaceFile(file, Bytes{'n'}); }

class WholeFile : public ::testing::Test {
protected:
    std::string path(const std::string& name) const {
        return folder_.file(name);
    }
    // Expects an operation to throw this error, with the file's name.
    template <class Operation>
    static void expectError(std::errc code, const std::string& file,
                            Operation operation) {
        try {
            operation(file);
            ADD_FAILURE() << "nothing was thrown";
        } catch (const std::system_error& error) {
            EXPECT_EQ(error.code(), code);
            EXPECT_NE(std::string(error.what()).find(file), std::string::npos)
                << error.what();
        }
    }
    std::size_t entries() const { return folder_.entries(); }

private:
    support::TemporaryFolder folder_;
};

TEST_F(WholeFile, ReadsWhatWasWritten) {
    const Bytes bytes = {0, 1, 255, 10, 0};
    replaceFile(path("a"), bytes);
    EXPECT_EQ(readWholeFile(path("a")), std::string("\0\1\xFF\n\0", 5));
    replaceFile(path("a"), {});
    EXPECT_EQ(readWholeFile(path("a")), "");
    EXPECT_EQ(entries(), 1U);
}

TEST_F(WholeFile, ReadsFilesOfManyBlocks) {
    const Bytes bytes(1'000'000, 7);
    replaceFile(path("a"), bytes);
    EXPECT_EQ(readWholeFile(path("a")), std::string(1'000'000, 7));
}

TEST_F(WholeFile, ReadsAPipeToItsEnd) {
    std::array<int, 2> ends{};
    ASSERT_EQ(::pipe2(ends.data(), O_CLOEXEC), 0);
    ASSERT_EQ(::write(ends[1], "text", 4), 4);
    // The end of the text comes when the last writer is gone.
    ASSERT_EQ(::close(ends[1]), 0);
    EXPECT_EQ(readWholeFile("/dev/fd/" + std::to_string(ends[0])), "text");
    ::close(ends[0]);
}

TEST_F(WholeFile, WritesToAPipeInsteadOfReplacingIt) {
    ASSERT_EQ(::mkfifo(path("pipe").c_str(), S_IRUSR | S_IWUSR), 0);
    const int reader =
        ::open(path("pipe").c_str(), O_RDONLY | O_NONBLOCK | O_CLOEXEC);
    ASSERT_GE(reader, 0);
    replaceFile(path("pipe"), Bytes{'t', 'e', 'x', 't'});
    EXPECT_TRUE(fs::is_fifo(path("pipe")));
    EXPECT_EQ(entries(), 1U);
    std::string text(8, ' ');
    EXPECT_EQ(::read(reader, text.data(), text.size()), 4);
    EXPECT_EQ(text.substr(0, 4), "text");
    ::close(reader);
}

TEST_F(WholeFile, KeepsTheTargetsPermissions) {
    std::ofstream(path("a")) << "old";
    fs::permissions(path("a"), fs::perms::owner_read | fs::perms::owner_write);
    replaceFile(path("a"), Bytes{'n'});
    EXPECT_EQ(fs::status(path("a")).permissions(),
              fs::perms::owner_read | fs::perms::owner_write);
    EXPECT_EQ(readWholeFile(path("a")), "n");
}

TEST_F(WholeFile, FollowsASymbolicLink) {
    std::ofstream(path("a")) << "old";
    fs::create_symlink("a", path("link"));
    replaceFile(path("link"), Bytes{'n'});
    EXPECT_TRUE(fs::is_symlink(path("link")));
    EXPECT_EQ(readWholeFile(path("a")), "n");
}

TEST_F(WholeFile, MakesWhatALinkPointsTo) {
    fs::create_directory(path("folder"));
    fs::create_symlink("folder/second", path("first"));
    fs::create_symlink("../a", path("folder/second"));
    replaceFile(path("first"), Bytes{'n'});
    EXPECT_TRUE(fs::is_symlink(path("first")));
    EXPECT_TRUE(fs::is_symlink(path("folder/second")));
    EXPECT_EQ(readWholeFile(path("a")), "n");
}

TEST_F(WholeFile, ALinkIntoNoFolderNamesTheLink) {
    fs::create_symlink("gone/a", path("link"));
    expectError(std::errc::no_such_file_or_directory, path("link"), replaceByN);
    EXPECT_EQ(entries(), 1U);
}

// Its link in /proc names a file that is not there, "NAME (deleted)".
TEST_F(WholeFile, AFileWithoutANameIsNotReplaced) {
    const int file = ::open(path("a").c_str(), O_RDWR | O_CREAT, 0600);
    ASSERT_GE(file, 0);
    fs::remove(path("a"));
    EXPECT_THROW(
        replaceFile("/proc/self/fd/" + std::to_string(file), Bytes{'n'}),
        std::system_error);
    ::close(file);
    EXPECT_EQ(entries(), 0U);
}

TEST_F(WholeFile, ALinkToItselfIsNotReplaced) {
    fs::create_symlink("link", path("link"));
    expectError(std::errc::too_many_symbolic_link_levels, path("link"),
                replaceByN);
    EXPECT_TRUE(fs::is_symlink(path("link")));
    EXPECT_EQ(entries(), 1U);
}

TEST_F(WholeFile, AFailedReplacementLeavesNothingBehind) {
    fs::create_directory(path("folder"));
    std::ofstream(path("folder/file")) << "kept";
    EXPECT_THROW(replaceFile(path("folder"), Bytes{'n'}), std::system_error);
    EXPECT_EQ(entries(), 1U);
    EXPECT_EQ(readWholeFile(path("folder/file")), "kept");
}

TEST_F(WholeFile, RemovesWhatAKilledProcessLeft) {
    std::ofstream(path(".a.tessel-abc123.tmp")) << "left";
    const std::vector<std::string> others = {
        ".a.tessel-abc123.tmpx", ".a.tessel-abc1234.tmp",
        ".b.tessel-abc123.tmp", "a.tessel-abc123.tmp"};
    for (const std::string& name : others) std::ofstream(path(name)) << "kept";
    replaceFile(path("a"), Bytes{'n'});
    EXPECT_FALSE(fs::exists(path(".a.tessel-abc123.tmp")));
    for (const std::string& name : others)
        EXPECT_TRUE(fs::exists(path(name))) << name;
    EXPECT_EQ(entries(), 5U);
}

TEST_F(WholeFile, LeavesWhatALivingProcessWrites) {
    const std::string name = path(".a.tessel-abc123.tmp");
    const int file =
        ::open(name.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, S_IRUSR | S_IWUSR);
    ASSERT_EQ(::flock(file, LOCK_EX), 0);
    replaceFile(path("a"), Bytes{'n'});
    EXPECT_TRUE(fs::exists(name));
    ::close(file);
    replaceFile(path("a"), Bytes{'n'});
    EXPECT_FALSE(fs::exists(name));
}

TEST_F(WholeFile, ANameMayBeAsLongAsAnyFiles) {
    constexpr std::size_t longest = 255;
    const std::string name = path(std::string(longest, 'n'));
    replaceFile(name, Bytes{'n'});
    EXPECT_EQ(readWholeFile(name), "n");
    EXPECT_EQ(entries(), 1U);
}

TEST_F(WholeFile, ANameWithANulIsNotCutThere) {
    const std::string name = path(std::string("a\0b", 3));
    EXPECT_THROW(replaceFile(name, Bytes{'n'}), std::system_error);
    EXPECT_EQ(entries(), 0U);
    std::ofstream(path("a")) << "another";
    EXPECT_THROW(readWholeFile(name), std::system_error);
}

TEST_F(WholeFile, ErrorsNameTheFile) {
    expectError(std::errc::no_such_file_or_directory, path("missing"),
                readWholeFile);
    EXPECT_THROW(replaceFile(path("no/file"), Bytes{1}), std::system_error);
    EXPECT_THROW(readWholeFile(path(".")), std::system_error);
}

}  // namespace
