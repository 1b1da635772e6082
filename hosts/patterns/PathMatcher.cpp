#include "hosts/patterns/PathMatcher.hpp"

#include <algorithm>

#include "hosts/patterns/Pattern.hpp"

namespace tessel::patterns {

namespace {

// Sorts spans and joins those that overlap or touch.
void joinSpans(std::vector<Span>& spans) {
    std::sort(spans.begin(), spans.end(),
              [](const Span& a, const Span& b) { return a.begin < b.begin; });
    std::vector<Span> joined;
    for (const Span& span : spans) {
        if (!joined.empty() && span.begin <= joined.back().end)
            joined.back().end = std::max(joined.back().end, span.end);
        else
            joined.push_back(span);
    }
    spans = std::move(joined);
}

}  // namespace

PathMatcher::PathMatcher(const std::vector<std::string>& patterns,
                         PatternKind kind, LetterCase letterCase) {
    for (const std::string& pattern : patterns)
        patterns_.push_back(
            std::make_unique<const Pattern>(pattern, kind, letterCase));
}

PathMatcher::PathMatcher(PathMatcher&&) noexcept = default;
PathMatcher& PathMatcher::operator=(PathMatcher&&) noexcept = default;
PathMatcher::~PathMatcher() = default;

bool PathMatcher::matches(std::string_view path) const {
    return std::all_of(
        patterns_.begin(), patterns_.end(),
        [&](const auto& pattern) { return pattern->matches(path); });
}

std::vector<Span> PathMatcher::spans(std::string_view path) const {
    std::vector<Span> spans;
    for (const auto& pattern : patterns_) pattern->appendSpans(path, spans);
    joinSpans(spans);
    return spans;
}

}  // namespace tessel::patterns
