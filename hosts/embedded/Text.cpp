#include "hosts/embedded/Text.hpp"

#include "paths/PathText.hpp"

namespace tessel::embedded {

namespace {

bool isPair(char32_t high, char32_t low) {
    return (high & 0xFC00U) == 0xD800U && (low & 0xFC00U) == 0xDC00U;
}

}  // namespace

std::string toUtf8(std::u16string_view text) {
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i) {
        char32_t code = text[i];
        if (i + 1 < text.size() && isPair(code, text[i + 1])) {
            const char32_t low = text[++i];
            code = 0x10000U + ((code - 0xD800U) << 10U) + (low - 0xDC00U);
        }
        paths::appendUtf8(code, bytes);
    }
    return bytes;
}

}  // namespace tessel::embedded
