#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <system_error>

#include "packing/LinkTarget.hpp"
#include "tests/support/TemporaryFolder.hpp"

namespace {

namespace fs = std::filesystem;

class LinkTarget : public testing::Test {
protected:
    // Links whose names are numbers, each to the one before.
    void makeChain(int links) const {
        for (int i = 1; i <= links; ++i)
            fs::create_symlink(std::to_string(i - 1), at(std::to_string(i)));
    }
    fs::path at(const std::string& name) const { return folder_.file(name); }
    static std::error_code errorOf(const fs::path& path) {
        std::error_code error;
        tessel::linkTarget(path, error);
        return error;
    }
    static fs::path targetOf(const fs::path& path) {
        std::error_code error = std::make_error_code(std::errc::io_error);
        const fs::path target = tessel::linkTarget(path, error);
        EXPECT_FALSE(error) << error.message();
        return target;
    }

private:
    support::TemporaryFolder folder_;
};

TEST_F(LinkTarget, WhatIsNoLinkIsItself) {
    EXPECT_EQ(targetOf("missing"), "missing");
    EXPECT_EQ(targetOf(at("missing/file")), at("missing/file"));
    EXPECT_EQ(targetOf("/"), "/");
}

TEST_F(LinkTarget, LinksLeadOnFromTheirOwnFolders) {
    fs::create_directory(at("folder"));
    fs::create_symlink("folder/second", at("first"));
    fs::create_symlink("../third", at("folder/second"));
    fs::create_symlink(at("file"), at("third"));
    EXPECT_EQ(targetOf(at("first")), at("file"));
}

TEST_F(LinkTarget, FollowsAsManyLinksAsLinux) {
    makeChain(41);
    EXPECT_EQ(targetOf(at("40")), at("0"));
    EXPECT_EQ(errorOf(at("41")), std::errc::too_many_symbolic_link_levels);
}

TEST_F(LinkTarget, ACircleEnds) {
    fs::create_symlink("there", at("here"));
    fs::create_symlink("here", at("there"));
    EXPECT_EQ(errorOf(at("here")), std::errc::too_many_symbolic_link_levels);
}

TEST_F(LinkTarget, SaysWhatTheSystemSays) {
    EXPECT_EQ(errorOf(at(std::string(300, 'x'))), std::errc::filename_too_long);
}

}  // namespace
