#include "hosts/patterns/Glob.hpp"

#include <fmt/format.h>

#include <cstddef>
#include <vector>

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

// Where the sets of a glob end. One pass finds all the ends: a glob of many '['
// and no ']' costs no more than any other glob of its length.
class SetEnds {
public:
    static constexpr std::size_t none = std::string_view::npos;

    explicit SetEnds(std::string_view glob)
        : glob_(glob),
          classEnds_(glob.size() + 2, none),
          ends_(glob.size() + 2, none) {
        for (std::size_t at = glob.size(); at-- > 0;) {
            classEnds_[at] =
                glob.substr(at, 2) == ":]" ? at + 2 : classEnds_[at + 1];
            ends_[at] = glob[at] == ']' ? at : ends_[behindMember(at)];
        }
    }

    // Where the ']' is that ends a set whose next member is at `at`, or none.
    std::size_t endFrom(std::size_t at) const { return ends_[at]; }

    // Behind the class of POSIX at `at`, such as "[:digit:]"; none if there is
    // no class.
    std::size_t behindClass(std::size_t at) const {
        return glob_.substr(at, 2) == "[:" ? classEnds_[at + 2] : none;
    }

private:
    std::size_t behindMember(std::size_t at) const {
        const std::size_t behind = behindClass(at);
        if (behind != none) return behind;
        return at + (glob_[at] == '\\' ? 2U : 1U);
    }

    std::string_view glob_;
    std::vector<std::size_t> classEnds_;  // behind the next ":]" from there
    std::vector<std::size_t> ends_;
};

// Translates one glob from its start to its end.
class GlobTranslation {
public:
    GlobTranslation(std::string_view glob, LetterCase letterCase,
                    PatternAlphabet alphabet)
        : glob_(glob),
          ends_(glob),
          letterCase_(letterCase),
          alphabet_(alphabet) {}

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

    // Where the ']' of the set is that starts at at_, or none.
    std::size_t setEnd() const {
        std::size_t at = at_;
        if (at < glob_.size() && (glob_[at] == '!' || glob_[at] == '^')) ++at;
        if (at < glob_.size() && glob_[at] == ']') ++at;
        return ends_.endFrom(at);
    }

    // Translates the set after a '['. Returns false if there is none.
    bool set() {
        const std::size_t end = setEnd();
        if (end == SetEnds::none) return false;
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
        const std::size_t behind = ends_.behindClass(at_);
        if (behind != SetEnds::none) {
            expression_ += glob_.substr(at_, behind - at_);
            at_ = behind;
            return;
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
    SetEnds ends_;
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
