#include <gtest/gtest.h>
#include <re2/re2.h>

#include <string>

#include "hosts/patterns/Glob.hpp"

namespace {

using tessel::patterns::globToExpression;
using tessel::patterns::LetterCase;
using tessel::patterns::PatternAlphabet;
using tessel::patterns::textToExpression;

bool matches(const std::string& glob, const std::string& text,
             LetterCase letterCase = LetterCase::Exact,
             PatternAlphabet alphabet = PatternAlphabet::Utf8) {
    RE2::Options options;
    options.set_dot_nl(true);
    if (alphabet == PatternAlphabet::Bytes)
        options.set_encoding(RE2::Options::EncodingLatin1);
    const RE2 expression(globToExpression(glob, letterCase, alphabet), options);
    EXPECT_TRUE(expression.ok()) << glob << ": " << expression.error();
    return RE2::FullMatch(text, expression);
}

TEST(Glob, StarsAndQuestionMarks) {
    EXPECT_TRUE(matches("*.h", "a/b.h"));
    EXPECT_TRUE(matches("*", ""));
    EXPECT_TRUE(matches("a**b", "ab"));
    EXPECT_TRUE(matches("a*b", "a\n/b"));
    EXPECT_FALSE(matches("*.h", "a.hpp"));
    EXPECT_TRUE(matches("a?c", "a/c"));
    EXPECT_TRUE(matches("?", "\xC3\xBC")) << "one character of two bytes";
    EXPECT_FALSE(matches("?", ""));
    EXPECT_FALSE(matches("??", "\xC3\xBC"));
    EXPECT_TRUE(matches(".*", ".x"));
    EXPECT_FALSE(matches(".*", "x")) << "the dot is itself";
}

TEST(Glob, Sets) {
    EXPECT_TRUE(matches("[abc]", "b"));
    EXPECT_FALSE(matches("[abc]", "d"));
    EXPECT_TRUE(matches("[a-c]x", "bx"));
    EXPECT_TRUE(matches("[!a-c]", "d"));
    EXPECT_TRUE(matches("[^a-c]", "d"));
    EXPECT_FALSE(matches("[!a-c]", "b"));
    EXPECT_TRUE(matches("[]a]", "]"));
    EXPECT_TRUE(matches("[!]a]", "b"));
    EXPECT_FALSE(matches("[!]a]", "]"));
    EXPECT_TRUE(matches("[a-]", "-"));
    EXPECT_TRUE(matches("[-a]", "-"));
    EXPECT_TRUE(matches("[[:digit:]x]", "5"));
    EXPECT_TRUE(matches("[\\]]", "]"));
    EXPECT_TRUE(matches("[*?]", "*"));
    EXPECT_FALSE(matches("[*?]", "a"));
    EXPECT_TRUE(matches("[\xC3\xA4-\xC3\xBC]", "\xC3\xB6"));
}

TEST(Glob, WhatIsNoSetIsText) {
    EXPECT_TRUE(matches("[", "["));
    EXPECT_TRUE(matches("a[bc", "a[bc"));
    EXPECT_TRUE(matches("[]", "[]"));
    EXPECT_TRUE(matches("[!", "[!"));
    EXPECT_TRUE(matches("a\\", "a\\"));
}

// To look for the end of each set in all that follows would take minutes.
TEST(Glob, ManySetsThatDoNotEndAreText) {
    for (const std::string part : {"[", "[:", "[[:a", "[!"}) {
        std::string text;
        while (text.size() < 200'000) text += part;
        EXPECT_EQ(
            globToExpression(text, LetterCase::Exact, PatternAlphabet::Bytes),
            textToExpression(text, LetterCase::Exact, PatternAlphabet::Bytes))
            << part;
        // One set of the whole text, apart from the last ']'.
        const std::string set = globToExpression(
            "[" + text + "x]]", LetterCase::Exact, PatternAlphabet::Bytes);
        EXPECT_TRUE(set.starts_with('[') && set.ends_with("]\\x5D")) << part;
    }
}

TEST(Glob, ClassesEndBeforeSets) {
    EXPECT_TRUE(matches("[[:alpha:][:digit:]]", "5"));
    EXPECT_TRUE(matches("[[:alpha:]", "[a")) << "the set is the second";
    EXPECT_TRUE(matches("[[:a]b:]", "[:b:]")) << "the set is the second";
    EXPECT_TRUE(matches("[[:]", ":"));
    EXPECT_TRUE(matches("[\\[:alpha:]]", "[]")) << "a bracket that is quoted";
}

TEST(Glob, EverythingElseIsItself) {
    const std::string special = "a.b(c)|d+{2}^$#\n\t\\\\\xC3\xBC";
    EXPECT_TRUE(matches(special, "a.b(c)|d+{2}^$#\n\t\\\xC3\xBC"));
    EXPECT_TRUE(matches("\\*\\?\\[", "*?["));
    EXPECT_FALSE(matches("\\*", "a"));
    for (int byte = 1; byte < 256; ++byte) {
        const std::string text(1, static_cast<char>(byte));
        const std::string glob = "\\" + text;
        EXPECT_TRUE(
            matches(glob, text, LetterCase::Exact, PatternAlphabet::Bytes))
            << byte;
    }
}

TEST(Glob, LetterCase) {
    const auto ignored = LetterCase::Ignored;
    EXPECT_TRUE(matches("READ*", "readme", ignored));
    EXPECT_FALSE(matches("READ*", "readme"));
    EXPECT_TRUE(matches("[a-c]", "B", ignored));
    EXPECT_TRUE(matches("\xC3\xA4", "\xC3\x84", ignored));
    const auto bytes = PatternAlphabet::Bytes;
    EXPECT_TRUE(matches("x[a-c]", "XB", ignored, bytes));
    EXPECT_FALSE(matches("\xE4", "\xC4", ignored, bytes))
        << "bytes beyond ASCII have no case";
}

TEST(Glob, TextsHaveNothingSpecial) {
    const std::string text = "a*[b]?.\\(\xFF";
    RE2::Options latin1;
    latin1.set_encoding(RE2::Options::EncodingLatin1);
    const RE2 expression(
        textToExpression(text, LetterCase::Exact, PatternAlphabet::Bytes),
        latin1);
    EXPECT_TRUE(RE2::FullMatch(text, expression));
    EXPECT_FALSE(RE2::FullMatch("ax[b]?.\\(\xFF", expression));
}

}  // namespace
