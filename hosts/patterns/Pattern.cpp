#include "hosts/patterns/Pattern.hpp"

#include <fmt/format.h>
#include <re2/re2.h>

#include <algorithm>

#include "hosts/patterns/PatternException.hpp"
#include "hosts/patterns/Utf8.hpp"

namespace tessel::patterns {

namespace {

re2::StringPiece pieceOf(std::string_view text) noexcept {
    return {text.data(), text.size()};
}

RE2::Options optionsFor(PatternKind kind, LetterCase letterCase,
                        PatternAlphabet alphabet) {
    RE2::Options options;
    options.set_log_errors(false);
    // A newline is a character of a name like any other.
    options.set_dot_nl(true);
    if (kind == PatternKind::Expression)
        options.set_case_sensitive(letterCase == LetterCase::Exact);
    if (alphabet == PatternAlphabet::Bytes)
        options.set_encoding(RE2::Options::EncodingLatin1);
    return options;
}

std::string expressionOf(const std::string& pattern, PatternKind kind,
                         LetterCase letterCase, PatternAlphabet alphabet) {
    switch (kind) {
        case PatternKind::Text:
            return textToExpression(pattern, letterCase, alphabet);
        case PatternKind::Glob:
            return globToExpression(pattern, letterCase, alphabet);
        default:
            return pattern;
    }
}

// Where the last component is, without the '/' after it.
Span lastComponent(std::string_view path) noexcept {
    const std::size_t last = path.find_last_not_of('/');
    if (last == std::string_view::npos) return {0, path.size()};
    const std::size_t slash = path.rfind('/', last);
    return {slash == std::string_view::npos ? 0 : slash + 1, last + 1};
}

}  // namespace

Pattern::Pattern(const std::string& pattern, PatternKind kind,
                 LetterCase letterCase)
    : kind_(kind),
      ofLastComponent_(kind == PatternKind::Glob &&
                       pattern.find('/') == std::string::npos) {
    if (kind == PatternKind::Text && letterCase == LetterCase::Exact) {
        text_ = pattern;
        return;
    }
    compile(pattern, letterCase, PatternAlphabet::Bytes);
    if (isUtf8(pattern)) compile(pattern, letterCase, PatternAlphabet::Utf8);
}

Pattern::~Pattern() = default;

void Pattern::compile(const std::string& pattern, LetterCase letterCase,
                      PatternAlphabet alphabet) {
    auto& target = alphabet == PatternAlphabet::Utf8 ? utf8_ : bytes_;
    target = std::make_unique<RE2>(
        expressionOf(pattern, kind_, letterCase, alphabet),
        optionsFor(kind_, letterCase, alphabet));
    if (!target->ok())
        throw PatternException(
            fmt::format("pattern '{}': {}", pattern, target->error()));
}

bool Pattern::matches(std::string_view path) const {
    if (bytes_ == nullptr) return path.find(text_) != std::string_view::npos;
    if (kind_ != PatternKind::Glob)
        return RE2::PartialMatch(pieceOf(path), expressionFor(path));
    const Span subject = subjectOf(path);
    return RE2::FullMatch(
        pieceOf(path.substr(subject.begin, subject.end - subject.begin)),
        expressionFor(path));
}

void Pattern::appendSpans(std::string_view path,
                          std::vector<Span>& spans) const {
    if (bytes_ == nullptr)
        appendTextSpans(path, spans);
    else if (kind_ == PatternKind::Glob)
        spans.push_back(subjectOf(path));
    else
        appendExpressionSpans(path, spans);
}

const RE2& Pattern::expressionFor(std::string_view path) const {
    return utf8_ != nullptr && isUtf8(path) ? *utf8_ : *bytes_;
}

Span Pattern::subjectOf(std::string_view path) const noexcept {
    return ofLastComponent_ ? lastComponent(path) : Span{0, path.size()};
}

void Pattern::appendTextSpans(std::string_view path,
                              std::vector<Span>& spans) const {
    if (text_.empty()) return;
    for (std::size_t at = path.find(text_); at != std::string_view::npos;
         at = path.find(text_, at + text_.size()))
        spans.push_back({at, at + text_.size()});
}

void Pattern::appendExpressionSpans(std::string_view path,
                                    std::vector<Span>& spans) const {
    const RE2& expression = expressionFor(path);
    re2::StringPiece match;
    std::size_t at = 0;
    while (at <= path.size() && expression.Match(pieceOf(path), at, path.size(),
                                                 RE2::UNANCHORED, &match, 1)) {
        const auto begin = static_cast<std::size_t>(match.data() - path.data());
        const std::size_t end = begin + match.size();
        if (end > begin) spans.push_back({begin, end});
        at = std::max(end, begin + 1);
    }
}

}  // namespace tessel::patterns
