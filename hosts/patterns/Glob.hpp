#pragma once

#include <string>
#include <string_view>

namespace tessel::patterns {

// How the letters of a pattern are taken.
enum class LetterCase { Exact, Ignored };

// What a pattern's characters are.
enum class PatternAlphabet { Utf8, Bytes };

// Translates a shell pattern to a regular expression of RE2 that the whole
// text has to match; `.` must match a newline, too.
//
//   *       any characters, also none, '/' included
//   ?       any one character, '/' included
//   [abc]   one of them; [a-z] a range, [!a] or [^a] any other,
//           [[:alpha:]] a class of POSIX; a ']' that comes first is itself
//   \x      x itself
//
// Everything else is itself, a '[' without its ']' included; a dot at the
// start of a name is nothing special. In bytes, only ASCII letters have a
// case.
std::string globToExpression(std::string_view glob, LetterCase letterCase,
                             PatternAlphabet alphabet);

// The text as a regular expression that matches nothing else.
std::string textToExpression(std::string_view text, LetterCase letterCase,
                             PatternAlphabet alphabet);

}  // namespace tessel::patterns
