#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

// A path is bytes to the operating system and UTF-16 to the coder. This is
// the way between the two, and it loses nothing:
//
//   bytes that are UTF-8        the characters that they encode
//   any other byte, 0x80..0xFF  one lone low surrogate, U+DC80..U+DCFF
//
// UTF-8 is read strictly: overlong forms, encoded surrogates and values above
// U+10FFFF are other bytes, each for itself. So every byte string has one
// UTF-16 text, but not every text comes from a byte string.
namespace tessel::paths {

// One step of decoding: how many bytes were read, and the one or two code
// units that they give.
struct DecodedCharacter {
    std::size_t byteCount = 1;
    std::size_t unitCount = 1;
    std::array<char16_t, 2> units{};
};

// Decodes the first character of bytes, which must not be empty.
DecodedCharacter decodeCharacter(std::string_view bytes) noexcept;

// Calls visit(char16_t) for every code unit of the bytes' text.
template <class Visit>
void forEachUnit(std::string_view bytes, Visit visit) {
    while (!bytes.empty()) {
        const auto first = static_cast<unsigned char>(bytes.front());
        if (first < 0x80) {
            visit(static_cast<char16_t>(first));
            bytes.remove_prefix(1);
            continue;
        }
        const DecodedCharacter character = decodeCharacter(bytes);
        for (std::size_t i = 0; i < character.unitCount; ++i) {
            visit(character.units[i]);
        }
        bytes.remove_prefix(character.byteCount);
    }
}

// Appends the UTF-8 of a number up to U+10FFFF. A surrogate's number gives the
// three bytes that any other number of its size takes: no strict UTF-8.
void appendUtf8(char32_t value, std::string& bytes);

// Appends the bytes' text.
void appendText(std::string_view bytes, std::u16string& text);
std::u16string toText(std::string_view bytes);

// Appends the bytes that have this text and returns true. Returns false, with
// `bytes` unchanged, if there are none: the text has a lone surrogate outside
// U+DC80..U+DCFF, or its U+DC80..U+DCFF units, taken as bytes, form valid UTF-8
// (such text is never produced).
bool appendBytes(std::u16string_view text, std::string& bytes);

}  // namespace tessel::paths
