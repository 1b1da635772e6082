#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hosts/patterns/PathMatcher.hpp"
#include "hosts/patterns/PatternException.hpp"

namespace {

using tessel::patterns::LetterCase;
using tessel::patterns::PathMatcher;
using tessel::patterns::PatternException;
using tessel::patterns::PatternKind;
using tessel::patterns::Span;

PathMatcher matcherOf(const std::vector<std::string>& patterns,
                      PatternKind kind,
                      LetterCase letterCase = LetterCase::Exact) {
    return {patterns, kind, letterCase};
}

TEST(PathMatcher, TextsAllHaveToBeThere) {
    const auto matcher = matcherOf({"b/", "c"}, PatternKind::Text);
    EXPECT_TRUE(matcher.matches("ab/c"));
    EXPECT_FALSE(matcher.matches("ab/d"));
    EXPECT_EQ(matcher.spans("ab/cxc"), (std::vector<Span>{{1, 4}, {5, 6}}));
}

TEST(PathMatcher, CaseOfTexts) {
    const auto matcher =
        matcherOf({"\xC3\xA4X"}, PatternKind::Text, LetterCase::Ignored);
    EXPECT_TRUE(matcher.matches("a\xC3\x84x"));
    EXPECT_FALSE(matcher.matches("a\xC3\x84y"));
    EXPECT_EQ(matcher.spans("a\xC3\x84x"), (std::vector<Span>{{1, 4}}));
    const auto ascii =
        matcherOf({"aB"}, PatternKind::Text, LetterCase::Ignored);
    EXPECT_TRUE(ascii.matches("\xFF/Ab")) << "also beside what is not UTF-8";
}

TEST(PathMatcher, GlobsWithoutSlashAreOfTheLastComponent) {
    const auto name = matcherOf({"b*"}, PatternKind::Glob);
    EXPECT_TRUE(name.matches("bc"));
    EXPECT_TRUE(name.matches("a/bc"));
    EXPECT_TRUE(name.matches("a/bc/")) << "a '/' at the end is no name";
    EXPECT_FALSE(name.matches("bc/a"));
    EXPECT_FALSE(name.matches("a/xb"));
    EXPECT_EQ(name.spans("a/bc/"), (std::vector<Span>{{2, 4}}));
    const auto path = matcherOf({"a/*.h"}, PatternKind::Glob);
    EXPECT_TRUE(path.matches("a/b/c.h"));
    EXPECT_FALSE(path.matches("x/a/b.h"));
    EXPECT_TRUE(matcherOf({"*"}, PatternKind::Glob).matches("///"));
}

TEST(PathMatcher, BytesThatAreNotUtf8AreCharacters) {
    EXPECT_TRUE(matcherOf({"a?b"}, PatternKind::Glob)
                    .matches("a\xFF"
                             "b"));
    EXPECT_TRUE(matcherOf({"a*b"}, PatternKind::Glob)
                    .matches("a\xC3\xFF"
                             "b"));
    EXPECT_TRUE(matcherOf({"a.b"}, PatternKind::Expression)
                    .matches("xa\xFF"
                             "bx"));
    EXPECT_TRUE(
        matcherOf({"\xFF*"}, PatternKind::Glob).matches("\xFF\xC3\xBC"));
    EXPECT_FALSE(matcherOf({"a??b"}, PatternKind::Glob)
                     .matches("a\xC3\xBC"
                              "b"));
}

TEST(PathMatcher, ExpressionsMatchAnywhere) {
    const auto matcher = matcherOf({"b+", "c$"}, PatternKind::Expression);
    EXPECT_TRUE(matcher.matches("abbc"));
    EXPECT_FALSE(matcher.matches("abbcd"));
    EXPECT_EQ(matcher.spans("abbxbc"), (std::vector<Span>{{1, 3}, {4, 6}}));
    const auto nothing = matcherOf({"x*"}, PatternKind::Expression);
    EXPECT_TRUE(nothing.matches("abc"));
    EXPECT_TRUE(nothing.spans("abc").empty());
    EXPECT_TRUE(matcherOf({"A.C"}, PatternKind::Expression, LetterCase::Ignored)
                    .matches("a\nc"));
}

TEST(PathMatcher, WrongExpressionsAreTold) {
    try {
        matcherOf({"ok", "a("}, PatternKind::Expression);
        FAIL() << "accepted";
    } catch (const PatternException& failure) {
        EXPECT_STREQ(failure.what(), "pattern 'a(': missing ): a(");
    }
}

}  // namespace
