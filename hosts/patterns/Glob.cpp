#include "hosts/patterns/Glob.hpp"

#include <fmt/format.h>

#include <cstddef>

namespace tessel::patterns {

namespace {

bool isAscii(char c) noexcept { return static_cast<unsigned char>(c) < 0x80; }

bool isLetter(char c) noexcept {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z');
}

// Appends one byte that stands for itself.
void appendByte(char c, LetterCase letterCase, PatternAlphabet alphabet,
                std::string& expression) {
    const bool isDigit = c >= '0' && c <= '9';
    const bool needsCode = isAscii(c) ? !isLetter(c) && !isDigit
                                      : alphabet == PatternAlphabet::Bytes;
    if (needsCode)
        expression += fmt::format("\\x{:02X}", static_cast<unsigned char>(c));
    else if (isLetter(c) && letterCase == LetterCase::Ignored &&
             alphabet == PatternAlphabet::Bytes)
        expression += fmt::format("(?i:{})", c);
    else
        expression.push_back(c);
}

std::string wrapped(const std::string& expression, LetterCase letterCase,
                    PatternAlphabet alphabet) {
    const bool folds =
        letterCase == LetterCase::Ignored && alphabet == PatternAlphabet::Utf8;
    return folds ? "(?i:" + expression + ")" : expression;
}

// Translates one glob from its start to its end.
class GlobTranslation {
public:
    GlobTranslation(std::string_view glob, LetterCase letterCase,
                    PatternAlphabet alphabet)
        : glob_(glob), letterCase_(letterCase), alphabet_(alphabet) {}

    std::string run() {
        while (at_ < glob_.size()) step();
        return wrapped(expression_, letterCase_, alphabet_);
    }

private:
    void step() {
        const char c = glob_[at_++];
        if (c == '*') {
            if (!expression_.ends_with(".*")) expression_ += ".*";
        } else if (c == '?') {
            expression_ += "(?:.)";
        } else if (c == '\\' && at_ < glob_.size()) {
            literal(glob_[at_++]);
        } else if (c != '[' || !set()) {
            literal(c);
        }
    }

    void literal(char c) { appendByte(c, letterCase_, alphabet_, expression_); }

    // Where the ']' of the set that starts at at_ is, or npos.
    std::size_t setEnd() const noexcept {
        std::size_t at = at_;
        if (at < glob_.size() && (glob_[at] == '!' || glob_[at] == '^')) ++at;
        if (at < glob_.size() && glob_[at] == ']') ++at;
        while (at < glob_.size() && glob_[at] != ']') {
            const std::size_t classEnd = glob_.substr(at, 2) == "[:"
                                             ? glob_.find(":]", at + 2)
                                             : std::string_view::npos;
            if (classEnd != std::string_view::npos)
                at = classEnd + 2;
            else
                at += glob_[at] == '\\' ? 2U : 1U;
        }
        return at < glob_.size() ? at : std::string_view::npos;
    }

    // Translates the set after a '['. Returns false if there is none.
    bool set() {
        const std::size_t end = setEnd();
        if (end == std::string_view::npos) return false;
        const bool foldsHere = letterCase_ == LetterCase::Ignored &&
                               alphabet_ == PatternAlphabet::Bytes;
        expression_ += foldsHere ? "(?i:[" : "[";
        if (glob_[at_] == '!' || glob_[at_] == '^') {
            expression_ += "^";
            ++at_;
        }
        while (at_ < end) member(end);
        ++at_;
        expression_ += foldsHere ? "])" : "]";
        return true;
    }

    // One character, the dash of a range, or a class of POSIX.
    void member(std::size_t end) {
        if (glob_.substr(at_, 2) == "[:") {
            const std::size_t classEnd = glob_.find(":]", at_ + 2);
            if (classEnd != std::string_view::npos && classEnd < end) {
                expression_ += glob_.substr(at_, classEnd + 2 - at_);
                at_ = classEnd + 2;
                return;
            }
        }
        char c = glob_[at_++];
        const bool isRange = c == '-' && !expression_.ends_with('[') &&
                             !expression_.ends_with("[^") && at_ < end;
        if (isRange) {
            expression_.push_back('-');
            return;
        }
        if (c == '\\' && at_ < end) c = glob_[at_++];
        appendByte(c, LetterCase::Exact, alphabet_, expression_);
    }

    std::string_view glob_;
    LetterCase letterCase_;
    PatternAlphabet alphabet_;
    std::size_t at_ = 0;
    std::string expression_;
};

}  // namespace

std::string globToExpression(std::string_view glob, LetterCase letterCase,
                             PatternAlphabet alphabet) {
    return GlobTranslation(glob, letterCase, alphabet).run();
}

std::string textToExpression(std::string_view text, LetterCase letterCase,
                             PatternAlphabet alphabet) {
    std::string expression;
    for (const char c : text) appendByte(c, letterCase, alphabet, expression);
    return wrapped(expression, letterCase, alphabet);
}

}  // namespace tessel::patterns
