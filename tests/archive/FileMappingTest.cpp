#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <system_error>
#include <utility>

#include "archive/FileMapping.hpp"

namespace tessel::archive {
namespace {

namespace fs = std::filesystem;

// A file that removes itself.
class TemporaryFile {
public:
    explicit TemporaryFile(const std::string& content)
        : path_(fs::temp_directory_path() /
                ("mapping-" + std::to_string(::getpid()))) {
        std::ofstream(path_, std::ios::binary) << content;
    }
    ~TemporaryFile() { fs::remove(path_); }
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;

    std::string path() const { return path_.string(); }

private:
    fs::path path_;
};

std::string textOf(const FileMapping& mapping) {
    return {mapping.bytes().begin(), mapping.bytes().end()};
}

// The error that mapping the file gives; 0 if there is none.
int errorOf(const std::string& file) {
    try {
        const FileMapping mapping(file);
        return 0;
    } catch (const std::system_error& error) {
        EXPECT_NE(std::string(error.what()).find(file), std::string::npos);
        return error.code().value();
    }
}

TEST(FileMapping, ShowsTheWholeFile) {
    const std::string content(10'000, 'x');
    const TemporaryFile file(content);
    EXPECT_EQ(textOf(FileMapping(file.path())), content);
}

TEST(FileMapping, EmptyFileHasNoBytes) {
    const TemporaryFile file("");
    EXPECT_TRUE(FileMapping(file.path()).bytes().empty());
}

TEST(FileMapping, MovingTakesTheBytesAlong) {
    const TemporaryFile file("abc");
    FileMapping first(file.path());
    FileMapping second(std::move(first));
    EXPECT_EQ(textOf(second), "abc");
    FileMapping third(file.path());
    third = std::move(second);
    EXPECT_EQ(textOf(third), "abc");
}

TEST(FileMapping, ReleasedPagesComeBack) {
    const TemporaryFile file(std::string(100'000, 'a') + "b");
    const FileMapping mapping(file.path());
    mapping.releasePages();
    EXPECT_EQ(textOf(mapping), std::string(100'000, 'a') + "b");
    const TemporaryFile empty("");
    FileMapping(empty.path()).releasePages();
}

TEST(FileMapping, OutlivesTheFilesName) {
    const auto file = std::make_unique<TemporaryFile>("abc");
    const FileMapping mapping(file->path());
    fs::remove(file->path());
    EXPECT_EQ(textOf(mapping), "abc");
}

TEST(FileMapping, SaysWhatCannotBeMapped) {
    EXPECT_EQ(errorOf("/nonexistent/file"), ENOENT);
    EXPECT_EQ(errorOf(fs::temp_directory_path().string()), EISDIR);
    EXPECT_EQ(errorOf("/dev/null"), ENODEV);
}

}  // namespace
}  // namespace tessel::archive
