#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/patterns/Glob.hpp"

namespace tessel::patterns {

// What the patterns of a search are.
enum class PatternKind { Text, Glob, Expression };

// A stretch of a path: bytes from begin up to, but without, end.
struct Span {
    std::size_t begin = 0;
    std::size_t end = 0;

    friend bool operator==(const Span&, const Span&) = default;
};

class Pattern;

// PathMatcher tells which paths match all of some patterns.
//
//   Text        is anywhere in the path
//   Glob        matches the whole path; a glob without '/' its last component
//               ("name" for "a/name" and "a/name/")
//   Expression  RE2, anywhere in the path
//
// A path is read as UTF-8 if it is that, otherwise as bytes, each of them one
// character.
//
// Threads: const members may be called from any number of threads.
class PathMatcher {
public:
    // Throws PatternException if an expression is wrong.
    PathMatcher(const std::vector<std::string>& patterns, PatternKind kind,
                LetterCase letterCase);
    PathMatcher(PathMatcher&&) noexcept;
    PathMatcher& operator=(PathMatcher&&) noexcept;
    ~PathMatcher();

    bool matches(std::string_view path) const;

    // What of a matching path to colour: ascending, disjoint, none empty.
    std::vector<Span> spans(std::string_view path) const;

private:
    std::vector<std::unique_ptr<const Pattern>> patterns_;
};

}  // namespace tessel::patterns
