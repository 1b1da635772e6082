#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <system_error>
#include <vector>

#include "archive/FileTarget.hpp"

namespace tessel::archive {
namespace {

namespace fs = std::filesystem;
using Bytes = std::vector<std::uint8_t>;

class FileTargetTest : public testing::Test {
protected:
    FileTargetTest()
        : folder_(
              fs::path(testing::TempDir()) /
              (std::string("target-") +
               testing::UnitTest::GetInstance()->current_test_info()->name())) {
        fs::remove_all(folder_);
        fs::create_directory(folder_);
    }
    ~FileTargetTest() override { fs::remove_all(folder_); }

    std::string at(const std::string& name) const {
        return (folder_ / name).string();
    }
    void put(const std::string& name, const std::string& text) const {
        std::ofstream(at(name)) << text;
    }
    std::string get(const std::string& name) const {
        std::ifstream in(at(name));
        return std::string(std::istreambuf_iterator<char>(in), {});
    }
    std::size_t files() const {
        return static_cast<std::size_t>(
            std::distance(fs::directory_iterator(folder_), {}));
    }

    fs::path folder_;
};

void writeAbc(FileTarget& target) {
    target.append(Bytes{'x', 'b'});
    target.append(Bytes{'c'});
    target.rewriteStart(Bytes{'a'});
}

TEST_F(FileTargetTest, CommitReplacesTheFileAtOnce) {
    put("list", "old");
    FileTarget target(at("list"));
    writeAbc(target);
    EXPECT_EQ(get("list"), "old");
    EXPECT_EQ(files(), 2U);
    target.commit();
    EXPECT_EQ(get("list"), "abc");
    EXPECT_EQ(files(), 1U);
}

TEST_F(FileTargetTest, WithoutCommitNothingIsLeft) {
    put("list", "old");
    {
        FileTarget target(at("list"));
        writeAbc(target);
    }
    EXPECT_EQ(get("list"), "old");
    EXPECT_EQ(files(), 1U);
}

TEST_F(FileTargetTest, KeepsPermissions) {
    put("list", "old");
    fs::permissions(at("list"), fs::perms::owner_read | fs::perms::group_read);
    FileTarget target(at("list"));
    writeAbc(target);
    target.commit();
    EXPECT_EQ(fs::status(at("list")).permissions(),
              fs::perms::owner_read | fs::perms::group_read);
}

TEST_F(FileTargetTest, ReplacesWhatALinkPointsTo) {
    fs::create_directory(at("elsewhere"));
    put("elsewhere/list", "old");
    fs::create_symlink("elsewhere/list", at("link"));
    FileTarget target(at("link"));
    writeAbc(target);
    target.commit();
    EXPECT_TRUE(fs::is_symlink(at("link")));
    EXPECT_EQ(get("elsewhere/list"), "abc");
}

TEST_F(FileTargetTest, MakesWhatALinkPointsTo) {
    fs::create_symlink("second", at("first"));
    fs::create_symlink(at("list"), at("second"));
    FileTarget target(at("first"));
    writeAbc(target);
    target.commit();
    EXPECT_TRUE(fs::is_symlink(at("first")));
    EXPECT_TRUE(fs::is_symlink(at("second")));
    EXPECT_EQ(get("list"), "abc");
}

TEST_F(FileTargetTest, KnowsHiddenFilesOfATarget) {
    fs::create_symlink("list", at("link"));
    for (const char* target : {"list", "link"}) {
        const auto isHidden = [&](const char* path) {
            return FileTarget::isHiddenFile(at(target), path);
        };
        EXPECT_TRUE(isHidden(".list.tessel-abc123.tmp"));
        EXPECT_TRUE(isHidden("a/b/.list.tessel-abc123.tmp"));
        EXPECT_FALSE(isHidden(".list.tessel-abc123.tmpx"));
        EXPECT_FALSE(isHidden(".list.tessel-abc1234.tmp"));
        EXPECT_FALSE(isHidden(".other.tessel-abc123.tmp"));
        EXPECT_FALSE(isHidden(".list.tessel-abc123.tmp/x"));
    }
}

TEST_F(FileTargetTest, RemovesWhatAKilledWriterLeft) {
    put(".list.tessel-abc123.tmp", "left");
    put(".list.tessel-abc123.tmpx", "not ours");
    put(".other.tessel-abc123.tmp", "not ours");
    FileTarget target(at("list"));
    EXPECT_FALSE(fs::exists(at(".list.tessel-abc123.tmp")));
    EXPECT_TRUE(fs::exists(at(".list.tessel-abc123.tmpx")));
    EXPECT_TRUE(fs::exists(at(".other.tessel-abc123.tmp")));
}

TEST_F(FileTargetTest, LeavesALiveWriterAlone) {
    FileTarget first(at("list"));
    writeAbc(first);
    FileTarget second(at("list"));
    second.append(Bytes{'z'});
    second.commit();
    EXPECT_EQ(get("list"), "z");
    first.commit();
    EXPECT_EQ(get("list"), "abc");
}

TEST_F(FileTargetTest, ALongNameIsCutInTheHiddenOne) {
    const std::string name(255, 'n');
    FileTarget target(at(name));
    writeAbc(target);
    target.commit();
    EXPECT_EQ(get(name), "abc");
}

TEST_F(FileTargetTest, ErrorsNameTheFile) {
    fs::create_symlink("loop", at("loop"));
    for (const auto& [file, code] :
         {std::pair{at("no/such/list"), std::errc::no_such_file_or_directory},
          {at("loop"), std::errc::too_many_symbolic_link_levels},
          {folder_.string(), std::errc::is_a_directory},
          {std::string("/dev/null"), std::errc::invalid_argument}}) {
        try {
            FileTarget target(file);
            ADD_FAILURE() << file;
        } catch (const std::system_error& error) {
            EXPECT_EQ(error.code(), code) << error.what();
            EXPECT_TRUE(std::string(error.what()).starts_with(file + ": "))
                << error.what();
        }
    }
}

TEST_F(FileTargetTest, WorksInTheCurrentFolder) {
    const fs::path before = fs::current_path();
    fs::current_path(folder_);
    FileTarget target("list");
    writeAbc(target);
    target.commit();
    fs::current_path(before);
    EXPECT_EQ(get("list"), "abc");
}

}  // namespace
}  // namespace tessel::archive
