#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <vector>

#include "hosts/embedded/MessageCatalogue.hpp"

// The message catalogue of the embedded host.
namespace tessel::embedded {

namespace {

class CatalogueTest : public testing::Test {
protected:
    CatalogueTest() {
        std::string pattern = testing::TempDir() + "catalogueXXXXXX";
        folder_ = mkdtemp(pattern.data());
    }
    ~CatalogueTest() override { std::filesystem::remove_all(folder_); }

    void write(const std::string& file, const std::string& content) {
        std::filesystem::create_directories((folder_ / file).parent_path());
        std::ofstream(folder_ / file) << content;
    }
    std::string text(const std::string& identifier,
                     const std::vector<HostMessageArgument>& arguments) {
        return MessageCatalogue(folder_).format(identifier, arguments);
    }

    std::filesystem::path folder_;
};

}  // namespace

TEST_F(CatalogueTest, ComponentIsThePathOfTheFile) {
    write("A/b/c.messages", "key: one\n");
    write("A/b.messages", "key: two\n");
    EXPECT_EQ(text("A:b:c:key", {}), "one");
    EXPECT_EQ(text("A:b:key", {}), "two");
}

TEST_F(CatalogueTest, ArgumentsAreFilledInByNumber) {
    write("a.messages", "key: {1} of {0}, {1}\n");
    EXPECT_EQ(text("a:key", {std::string("x"), std::int64_t{5}}), "5 of x, 5");
}

TEST_F(CatalogueTest, FilledInTextIsNotFilledInAgain) {
    write("a.messages", "key: {0}{1}\n");
    EXPECT_EQ(text("a:key", {std::string("{1}"), std::string("{0}")}),
              "{1}{0}");
}

TEST_F(CatalogueTest, WhatIsNoPlaceholderStays) {
    write("a.messages", "key: {} {x} {0 {2} 0} {0}\n");
    EXPECT_EQ(text("a:key", {std::string("y")}), "{} {x} {0 {2} 0} y");
}

TEST_F(CatalogueTest, BlankLinesAndRemarksSayNothing) {
    write("a.messages", "# remark: no\n\n   \nkey: yes: a colon\n");
    EXPECT_EQ(text("a:key", {}), "yes: a colon");
    EXPECT_EQ(text("a:# remark", {}), "a:# remark");
}

TEST_F(CatalogueTest, OtherFilesAreNotRead) {
    write("a.txt", "no message at all\n");
    EXPECT_EQ(text("a:key", {std::int64_t{1}}), "a:key: 1");
}

TEST_F(CatalogueTest, LineThatIsNoMessageIsRefusedByPlace) {
    write("a.messages", "key: text\n\nno message\n");
    try {
        text("a:key", {});
        FAIL() << "the line was accepted";
    } catch (const CatalogueException& refusal) {
        EXPECT_EQ(refusal.what(), (folder_ / "a.messages").string() +
                                      ":3: this line is no message.");
    }
}

TEST_F(CatalogueTest, MissingFolderIsRefused) {
    EXPECT_THROW(MessageCatalogue(folder_ / "none"), CatalogueException);
}

TEST(SuppliedCatalogue, HasTheFourTextsOfThePlugin) {
    const MessageCatalogue catalogue(QZTESSEL_MESSAGES);
    const std::vector<HostMessageArgument> position = {std::string("12, 3")};
    const auto text = [&](const std::string& key) {
        return catalogue.format("VELOX:datastoreio:huffmanpaths:" + key,
                                position);
    };
    EXPECT_EQ(text("fileListNotEven"),
              "The list of folders and files must have an even number of "
              "elements: folders first, then as many lists of files.");
    EXPECT_EQ(text("unequalNumFolderFileList"),
              "The number of folders must be the number of lists of files.");
    EXPECT_EQ(text("folderElementEmpty"),
              "Element 12, 3 of the folders is empty.");
    EXPECT_EQ(text("fileElementEmpty"), "Element 12, 3 of the files is empty.");
}

}  // namespace tessel::embedded
