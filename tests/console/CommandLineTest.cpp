#include <gtest/gtest.h>

#include "hosts/console/CommandLine.hpp"
#include "hosts/console/ConsoleException.hpp"

namespace {

using tessel::console::CommandLine;
using tessel::console::ConsoleException;
using tessel::console::ExitStatus;
using Strings = std::vector<std::string>;

// A command line with one of everything.
class CommandLineTest : public testing::Test {
protected:
    CommandLineTest() : line_("tessel try", "Try it", "  tessel try x") {
        line_.argument("FILE", file_, "A file");
        line_.arguments("WORD", words_, CommandLine::Need::Optional, "Words");
        line_.flag("-0", nul_, "A flag");
        line_.value("--folder", "F", folder_, "A value");
        line_.number("-j", "N", threads_, "A number");
        line_.choice("--level", {"low", "high"}, level_, "A choice");
    }

    CommandLine::Request parse(const Strings& words) {
        return line_.parse(words);
    }

    std::string failureOf(const Strings& words) {
        try {
            line_.parse(words);
        } catch (const ConsoleException& failure) {
            EXPECT_EQ(failure.status(), ExitStatus::Usage);
            return failure.what();
        }
        return "accepted";
    }

    CommandLine line_;
    std::string file_;
    Strings words_;
    bool nul_ = false;
    std::optional<std::string> folder_;
    std::optional<std::uint64_t> threads_;
    std::string level_ = "low";
};

TEST_F(CommandLineTest, ReadsEverything) {
    EXPECT_EQ(parse({"f", "-0", "a", "--folder", "x/y", "b", "-j2", "--level",
                     "high"}),
              CommandLine::Request::Run);
    EXPECT_EQ(file_, "f");
    EXPECT_EQ(words_, (Strings{"a", "b"}));
    EXPECT_TRUE(nul_);
    EXPECT_EQ(folder_, "x/y");
    EXPECT_EQ(threads_, 2U);
    EXPECT_EQ(level_, "high");
}

TEST_F(CommandLineTest, TakesWordsAsTheyAre) {
    parse({"[f]", "[a,b]", "", "-", "[]", "--folder", "[c]", "{}", "a b",
           "\xFF"});
    EXPECT_EQ(file_, "[f]");
    EXPECT_EQ(words_, (Strings{"[a,b]", "", "-", "[]", "{}", "a b", "\xFF"}));
    EXPECT_EQ(folder_, "[c]");
}

TEST_F(CommandLineTest, TakesBytesThatItUsesItself) {
    parse({"\x1f", "\x1f[a]", "\x1f\x1f", "--folder", "\x1fx"});
    EXPECT_EQ(file_, "\x1f");
    EXPECT_EQ(words_, (Strings{"\x1f[a]", "\x1f\x1f"}));
    EXPECT_EQ(folder_, "\x1fx");
}

TEST_F(CommandLineTest, TakesValuesAfterAnEqualsSign) {
    for (const std::string value : {"", "[c]", "\x1f", "\x1fx", "a=b", "="}) {
        parse({"f", "--folder=" + value});
        EXPECT_EQ(folder_, value);
    }
    parse({"f", "--", "--folder=", "--folder=\x1f"});
    EXPECT_EQ(words_, (Strings{"--folder=", "--folder=\x1f"}));
}

TEST_F(CommandLineTest, TheLastOfSeveralValuesCounts) {
    parse({"f", "-j", "2", "--folder", "x", "--level", "high", "-j3",
           "--folder=y", "--level", "low", "-0", "-0"});
    EXPECT_EQ(threads_, 3U);
    EXPECT_EQ(folder_, "y");
    EXPECT_EQ(level_, "low");
    EXPECT_TRUE(nul_);
}

TEST_F(CommandLineTest, TellsAnEmptyArgumentFromNone) {
    CommandLine line("tessel try", "Try it", "  tessel try x");
    std::optional<std::string> list;
    line.argument("LIST", list, "A list");
    line.parse({});
    EXPECT_FALSE(list);
    line.parse(Strings{""});
    EXPECT_EQ(list, "");
}

TEST_F(CommandLineTest, TakesNumbersUpToTheirLimit) {
    parse({"f", "-j", "18446744073709551615"});
    EXPECT_EQ(threads_, UINT64_MAX);
}

TEST_F(CommandLineTest, TwoDashesEndTheFlags) {
    parse({"-0", "--", "f", "-0", "--folder"});
    EXPECT_EQ(words_, (Strings{"-0", "--folder"}));
    EXPECT_FALSE(folder_);
}

TEST_F(CommandLineTest, NegativeNumbersAreArguments) {
    parse({"f", "-1", "-0", "-10--1", "5"});
    EXPECT_EQ(words_, (Strings{"-1", "-10--1", "5"}));
    EXPECT_TRUE(nul_);
}

TEST_F(CommandLineTest, RefusesInOneLineThatPointsToTheHelp) {
    for (const Strings& words :
         {Strings{}, Strings{"f", "--no"}, Strings{"f", "-x"},
          Strings{"f", "--folder"}, Strings{"f", "-j", "x"},
          Strings{"f", "-j", "-1"}, Strings{"f", "-j", "18446744073709551616"},
          Strings{"f", "-j", ""}, Strings{"f", "--level", "middle"}}) {
        const std::string line = failureOf(words);
        EXPECT_TRUE(line.ends_with("; see `tessel try --help`"))
            << line << testing::PrintToString(words);
        EXPECT_EQ(line.find('\n'), std::string::npos) << line;
        EXPECT_EQ(line.find('\x1f'), std::string::npos) << line;
    }
}

TEST_F(CommandLineTest, HelpNamesEverything) {
    EXPECT_EQ(parse({"--help"}), CommandLine::Request::Help);
    const std::string help = line_.help();
    for (const char* part : {"Try it", "FILE", "WORD", "-0", "--folder F",
                             "-j N", "low|high", "Examples:\n  tessel try x"})
        EXPECT_NE(help.find(part), std::string::npos) << part << "\n" << help;
}

}  // namespace
