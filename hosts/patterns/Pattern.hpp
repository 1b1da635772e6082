#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/patterns/PathMatcher.hpp"

namespace re2 {
class RE2;
}

namespace tessel::patterns {

// One pattern of a PathMatcher, which explains the kinds.
//
// An expression is compiled twice, for UTF-8 and for bytes: RE2's `.` matches
// no byte that is not UTF-8.
class Pattern {
public:
    // Throws PatternException if an expression is wrong.
    Pattern(const std::string& pattern, PatternKind kind,
            LetterCase letterCase);
    Pattern(const Pattern&) = delete;
    Pattern& operator=(const Pattern&) = delete;
    ~Pattern();

    bool matches(std::string_view path) const;

    // Appends what of a matching path to colour.
    void appendSpans(std::string_view path, std::vector<Span>& spans) const;

private:
    void compile(const std::string& pattern, LetterCase letterCase,
                 PatternAlphabet alphabet);
    const re2::RE2& expressionFor(std::string_view path) const;
    Span subjectOf(std::string_view path) const noexcept;
    void appendTextSpans(std::string_view path, std::vector<Span>& spans) const;
    void appendExpressionSpans(std::string_view path,
                               std::vector<Span>& spans) const;

    PatternKind kind_;
    bool ofLastComponent_ = false;
    std::string text_;  // if it is a text whose letter case counts
    std::unique_ptr<const re2::RE2> utf8_;  // null if the pattern is not UTF-8
    std::unique_ptr<const re2::RE2> bytes_;
};

}  // namespace tessel::patterns
