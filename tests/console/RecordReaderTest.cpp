#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <string>
#include <vector>

#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/RecordReader.hpp"

namespace {

using tessel::console::ConsoleException;
using tessel::console::InputFile;
using tessel::console::Interrupts;
using tessel::console::RecordReader;
using tessel::console::Separator;
using Strings = std::vector<std::string>;

// A file that is removed at the end, and what reads it.
class RecordReaderTest : public testing::Test {
protected:
    RecordReaderTest() {
        const int file = ::mkstemp(name_.data());
        EXPECT_GE(file, 0);
        ::close(file);
    }
    ~RecordReaderTest() override { std::remove(name_.c_str()); }

    void write(const std::string& text) const {
        std::ofstream(name_, std::ios::binary) << text;
    }

    Strings read(Separator separator) const {
        InputFile input(name_, interrupts_);
        RecordReader records(input, separator);
        Strings strings;
        while (const auto record = records.next()) {
            strings.emplace_back(*record);
            EXPECT_EQ(records.line(), strings.size());
        }
        return strings;
    }

    Interrupts interrupts_;
    std::string name_ = testing::TempDir() + "records-XXXXXX";
};

TEST_F(RecordReaderTest, CutsAtTheSeparator) {
    write("a\n\nb");
    EXPECT_EQ(read(Separator::Newline), (Strings{"a", "", "b"}));
    write(std::string("a\n\0\0b", 5));
    EXPECT_EQ(read(Separator::Nul), (Strings{"a\n", "", "b"}));
    write("");
    EXPECT_TRUE(read(Separator::Newline).empty());
    write("\n");
    EXPECT_EQ(read(Separator::Newline), Strings{""});
}

TEST_F(RecordReaderTest, RecordsAreWholeAcrossBlocks) {
    Strings expected;
    std::string text;
    for (std::size_t i = 0; text.size() < 3'000'000; ++i) {
        expected.emplace_back(i * 37 % 5000, static_cast<char>('a' + i % 26));
        text += expected.back() + "\n";
    }
    write(text);
    EXPECT_EQ(read(Separator::Newline), expected);
}

TEST_F(RecordReaderTest, RefusesWhatIsTooLong) {
    write("ok\n" + std::string(5 << 20, 'x'));
    try {
        read(Separator::Newline);
        FAIL() << "accepted";
    } catch (const ConsoleException& failure) {
        EXPECT_NE(std::string(failure.what()).find("(line 2)"),
                  std::string::npos)
            << failure.what();
    }
}

TEST_F(RecordReaderTest, WhatWasPeekedAtIsStillRead) {
    write("abc\ndef\n");
    InputFile input(name_, interrupts_);
    RecordReader records(input, Separator::Newline);
    EXPECT_EQ(records.peek(5), "abc\nd");
    EXPECT_EQ(records.peek(50), "abc\ndef\n");
    EXPECT_TRUE(records.hasNext());
    EXPECT_EQ(records.next(), "abc");
    EXPECT_EQ(records.takeRest(), "def\n");
}

}  // namespace
