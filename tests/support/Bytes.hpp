#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <vector>

// Building and showing bytes in tests.
namespace support {

using Bytes = std::vector<std::uint8_t>;

// The value in `width` bytes, least significant first.
inline Bytes littleEndian(std::uint64_t value, unsigned width) {
    Bytes bytes;
    for (unsigned j = 0; j < width; ++j)
        bytes.push_back(static_cast<std::uint8_t>(value >> (8 * j)));
    return bytes;
}

inline Bytes u16(std::uint64_t value) { return littleEndian(value, 2); }
inline Bytes u32(std::uint64_t value) { return littleEndian(value, 4); }
inline Bytes u64(std::uint64_t value) { return littleEndian(value, 8); }

inline Bytes join(std::initializer_list<Bytes> parts) {
    Bytes whole;
    for (const Bytes& part : parts)
        whole.insert(whole.end(), part.begin(), part.end());
    return whole;
}

inline void append(Bytes& to, const Bytes& more) {
    to.insert(to.end(), more.begin(), more.end());
}

// "01 AB": for messages.
inline std::string hex(const Bytes& bytes) {
    constexpr const char* digits = "0123456789ABCDEF";
    std::string text;
    for (const std::uint8_t byte : bytes) {
        if (!text.empty()) text += ' ';
        text += digits[byte >> 4];
        text += digits[byte & 0xFU];
    }
    return text;
}

// "010" for false, true, false.
inline std::string bitText(const std::vector<bool>& bits) {
    std::string text;
    for (const bool bit : bits) text += bit ? '1' : '0';
    return text;
}

inline std::vector<bool> bitsOf(const std::string& text) {
    std::vector<bool> bits;
    for (const char digit : text)
        if (digit != ' ') bits.push_back(digit == '1');
    return bits;
}

}  // namespace support
