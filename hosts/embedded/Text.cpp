#include "hosts/embedded/Text.hpp"

namespace tessel::embedded {

namespace {

bool isPair(char32_t high, char32_t low) {
    return (high & 0xFC00U) == 0xD800U && (low & 0xFC00U) == 0xDC00U;
}

void append(std::string& bytes, char32_t code) {
    const auto continuation = [&](unsigned shift) {
        return static_cast<char>(0x80U | ((code >> shift) & 0x3FU));
    };
    if (code < 0x80U) {
        bytes += static_cast<char>(code);
    } else if (code < 0x800U) {
        bytes += static_cast<char>(0xC0U | (code >> 6U));
        bytes += continuation(0);
    } else if (code < 0x10000U) {
        bytes += static_cast<char>(0xE0U | (code >> 12U));
        bytes += continuation(6);
        bytes += continuation(0);
    } else {
        bytes += static_cast<char>(0xF0U | (code >> 18U));
        bytes += continuation(12);
        bytes += continuation(6);
        bytes += continuation(0);
    }
}

}  // namespace

std::string toUtf8(std::u16string_view text) {
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t code = text[i];
        if (i + 1 < text.size() && isPair(code, text[i + 1])) {
            code = 0x10000U + ((code - 0xD800U) << 10U) +
                   (char32_t{text[++i]} - 0xDC00U);
        }
        append(bytes, code);
    }
    return bytes;
}

}  // namespace tessel::embedded
