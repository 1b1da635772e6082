#include <gtest/gtest.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <system_error>
#include <utility>

#include "archive/ArchiveExceptions.hpp"
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

// A text of several pages without a zero byte, whose end is unlike its rest.
std::string severalPages() {
    return std::string(20'000, 'x') + "the end of the file";
}

// Reads all bytes, whatever they are, so that lost pages are touched.
bool isIntactAfterReading(const FileMapping& mapping) {
    EXPECT_EQ(textOf(mapping).size(), mapping.bytes().size());
    return mapping.isIntact();
}

TEST(FileMapping, NoticesEveryCut) {
    const std::string content = severalPages();
    for (std::size_t size = 0; size < content.size(); ++size) {
        if (size > 5 && size + 5 < content.size() && size % 4096 > 2) continue;
        const TemporaryFile file(content);
        const FileMapping mapping(file.path());
        EXPECT_TRUE(isIntactAfterReading(mapping));
        mapping.requireIntact();
        fs::resize_file(file.path(), size);
        EXPECT_FALSE(mapping.isIntact()) << size << ", before it is read";
        EXPECT_FALSE(isIntactAfterReading(mapping)) << size;
        EXPECT_THROW(mapping.requireIntact(), DamagedArchiveException);
        EXPECT_EQ(textOf(mapping).substr(0, size), content.substr(0, size));
    }
}

TEST(FileMapping, ACutThatIsMendedIsNotForgotten) {
    const std::string content = severalPages();
    const TemporaryFile file(content);
    const FileMapping mapping(file.path());
    fs::resize_file(file.path(), 100);
    EXPECT_EQ(textOf(mapping).substr(0, 100), content.substr(0, 100));
    std::ofstream(file.path(), std::ios::binary) << content;
    EXPECT_FALSE(mapping.isIntact());
}

TEST(FileMapping, NoticesAFileThatIsWrittenAnew) {
    for (const std::size_t size : {30U, 20'019U, 30'000U}) {
        const TemporaryFile file(severalPages());
        const FileMapping mapping(file.path());
        std::ofstream(file.path(), std::ios::binary) << std::string(size, 'y');
        EXPECT_FALSE(isIntactAfterReading(mapping)) << size;
    }
}

TEST(FileMapping, ALongerFileIsStillIntact) {
    const std::string content = severalPages();
    const TemporaryFile file(content);
    const FileMapping mapping(file.path());
    std::ofstream(file.path(), std::ios::app) << "more";
    EXPECT_TRUE(isIntactAfterReading(mapping));
    EXPECT_EQ(textOf(mapping), content);
}

TEST(FileMapping, ASmallFileIsWatchedToo) {
    for (const std::size_t size : {1U, 7U, 8U, 9U}) {
        const TemporaryFile file(std::string(size, 'x'));
        const FileMapping mapping(file.path());
        EXPECT_TRUE(isIntactAfterReading(mapping));
        fs::resize_file(file.path(), 0);
        EXPECT_FALSE(isIntactAfterReading(mapping)) << size;
    }
    const TemporaryFile empty("");
    EXPECT_TRUE(FileMapping(empty.path()).isIntact());
}

TEST(FileMapping, MovingKeepsWhatIsKnownOfTheFile) {
    const TemporaryFile file(severalPages());
    FileMapping first(file.path());
    fs::resize_file(file.path(), 0);
    EXPECT_FALSE(isIntactAfterReading(first));
    FileMapping second(std::move(first));
    EXPECT_FALSE(second.isIntact());
    const TemporaryFile empty("");
    FileMapping third(empty.path());
    third = std::move(second);
    EXPECT_FALSE(third.isIntact());
}

TEST(FileMapping, SettlesForWhatIsThere) {
    const TemporaryFile file(severalPages());
    FileMapping mapping(file.path());
    fs::resize_file(file.path(), 10'000);
    mapping.settle();
    EXPECT_TRUE(isIntactAfterReading(mapping));
    fs::resize_file(file.path(), 100);
    EXPECT_FALSE(isIntactAfterReading(mapping));
    const TemporaryFile empty("");
    FileMapping(empty.path()).settle();
}

TEST(FileMapping, SaysWhatCannotBeMapped) {
    EXPECT_EQ(errorOf("/nonexistent/file"), ENOENT);
    EXPECT_EQ(errorOf(fs::temp_directory_path().string()), EISDIR);
    EXPECT_EQ(errorOf("/dev/null"), ENODEV);
}

}  // namespace
}  // namespace tessel::archive
