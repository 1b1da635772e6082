#include "paths/PathText.hpp"

namespace tessel::paths {

namespace {

constexpr char32_t byteSurrogates = 0xDC00;  // plus the byte

bool isHighSurrogate(char16_t unit) noexcept {
    return unit >= 0xD800 && unit <= 0xDBFF;
}

bool isLowSurrogate(char16_t unit) noexcept {
    return unit >= 0xDC00 && unit <= 0xDFFF;
}

bool isByteSurrogate(char16_t unit) noexcept {
    return unit >= 0xDC80 && unit <= 0xDCFF;
}

// The bytes that a character takes whose first byte this is, 0 if none can
// begin so.
std::size_t sequenceLength(unsigned char first) noexcept {
    if (first >= 0xC2 && first <= 0xDF) return 2;
    if (first >= 0xE0 && first <= 0xEF) return 3;
    if (first >= 0xF0 && first <= 0xF4) return 4;
    return 0;
}

// The smallest value that needs this many bytes.
char32_t smallestOf(std::size_t byteCount) noexcept {
    if (byteCount == 2) return 0x80;
    return byteCount == 3 ? 0x800 : 0x10000;
}

bool isScalar(char32_t value) noexcept {
    return value <= 0x10FFFF && !(value >= 0xD800 && value <= 0xDFFF);
}

// Reads the character of several bytes at the front of bytes into value and
// returns their number, or 0 if they are not UTF-8.
std::size_t readMultibyte(std::string_view bytes, char32_t& value) noexcept {
    const auto first = static_cast<unsigned char>(bytes.front());
    const std::size_t length = sequenceLength(first);
    if (length == 0 || length > bytes.size()) return 0;
    value = first & (0x7FU >> length);
    for (std::size_t i = 1; i < length; ++i) {
        const auto next = static_cast<unsigned char>(bytes[i]);
        if ((next & 0xC0U) != 0x80U) return 0;
        value = (value << 6U) | (next & 0x3FU);
    }
    return value >= smallestOf(length) && isScalar(value) ? length : 0;
}

// Appends the text and returns true if all of it is ASCII, as most names are.
// One loop without branches, which compilers turn into vector instructions.
bool appendAscii(std::u16string_view text, std::string& bytes) {
    const std::size_t before = bytes.size();
    bytes.resize(before + text.size());
    char* to = bytes.data() + before;
    unsigned allUnits = 0;
    for (std::size_t i = 0; i < text.size(); ++i) {
        allUnits |= text[i];
        to[i] = static_cast<char>(text[i]);
    }
    if (allUnits < 0x80) return true;
    bytes.resize(before);
    return false;
}

// Appends the bytes of the text without asking whether they have this text.
// Returns false at a surrogate without meaning; escaped becomes true if the
// text has bytes' surrogates.
bool appendUnchecked(std::u16string_view text, std::string& bytes,
                     bool& escaped) {
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char16_t unit = text[i];
        if (isHighSurrogate(unit) && i + 1 < text.size() &&
            isLowSurrogate(text[i + 1])) {
            const char32_t high = unit - char32_t{0xD800};
            appendUtf8(0x10000 + (high << 10U) + (text[++i] - char32_t{0xDC00}),
                       bytes);
        } else if (isByteSurrogate(unit)) {
            bytes.push_back(static_cast<char>(unit - byteSurrogates));
            escaped = true;
        } else if (isHighSurrogate(unit) || isLowSurrogate(unit)) {
            return false;
        } else {
            appendUtf8(unit, bytes);
        }
    }
    return true;
}

bool hasText(std::string_view bytes, std::u16string_view text) {
    std::size_t at = 0;
    bool same = true;
    forEachUnit(bytes, [&](char16_t unit) {
        same = same && at < text.size() && text[at] == unit;
        ++at;
    });
    return same && at == text.size();
}

}  // namespace

DecodedCharacter decodeCharacter(std::string_view bytes) noexcept {
    DecodedCharacter character;
    const auto first = static_cast<unsigned char>(bytes.front());
    char32_t value = first;
    if (first >= 0x80) {
        character.byteCount = readMultibyte(bytes, value);
        if (character.byteCount == 0) {
            character.byteCount = 1;
            value = byteSurrogates + first;
        }
    }
    if (value >= 0x10000) {
        value -= 0x10000;
        character.unitCount = 2;
        character.units = {static_cast<char16_t>(0xD800 + (value >> 10U)),
                           static_cast<char16_t>(0xDC00 + (value & 0x3FFU))};
    } else {
        character.units[0] = static_cast<char16_t>(value);
    }
    return character;
}

void appendUtf8(char32_t value, std::string& bytes) {
    const auto tail = [&](unsigned shift) {
        bytes.push_back(static_cast<char>(0x80U | ((value >> shift) & 0x3FU)));
    };
    if (value < 0x80) {
        bytes.push_back(static_cast<char>(value));
    } else if (value < 0x800) {
        bytes.push_back(static_cast<char>(0xC0U | (value >> 6U)));
        tail(0);
    } else if (value < 0x10000) {
        bytes.push_back(static_cast<char>(0xE0U | (value >> 12U)));
        tail(6);
        tail(0);
    } else {
        bytes.push_back(static_cast<char>(0xF0U | (value >> 18U)));
        tail(12);
        tail(6);
        tail(0);
    }
}

void appendText(std::string_view bytes, std::u16string& text) {
    // No text has more units than its bytes.
    const std::size_t before = text.size();
    text.resize(before + bytes.size());
    char16_t* to = text.data() + before;
    forEachUnit(bytes, [&](char16_t unit) { *to++ = unit; });
    text.resize(static_cast<std::size_t>(to - text.data()));
}

std::u16string toText(std::string_view bytes) {
    std::u16string text;
    appendText(bytes, text);
    return text;
}

bool appendBytes(std::u16string_view text, std::string& bytes) {
    if (appendAscii(text, bytes)) return true;
    const std::size_t before = bytes.size();
    bool escaped = false;
    if (appendUnchecked(text, bytes, escaped) &&
        (!escaped || hasText(std::string_view(bytes).substr(before), text))) {
        return true;
    }
    bytes.resize(before);
    return false;
}

}  // namespace tessel::paths
