#include "hosts/console/JsonText.hpp"

#include <cstddef>
#include <cstdint>

#include "hosts/patterns/Utf8.hpp"

namespace tessel::console {

std::string base64(std::string_view bytes) {
    constexpr std::string_view digits =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
    std::string text;
    for (std::size_t i = 0; i < bytes.size(); i += 3) {
        std::uint32_t bits = 0;
        for (std::size_t k = i; k < i + 3; ++k)
            bits =
                bits << 8 |
                (k < bytes.size() ? static_cast<unsigned char>(bytes[k]) : 0);
        for (const unsigned shift : {18U, 12U, 6U, 0U})
            text.push_back(digits[bits >> shift & 63U]);
    }
    const std::size_t missing = (3 - bytes.size() % 3) % 3;
    return text.replace(text.size() - missing, missing, missing, '=');
}

Json jsonOfBytes(std::string_view bytes) {
    if (patterns::isUtf8(bytes)) return std::string(bytes);
    return {{"bytes", base64(bytes)}};
}

}  // namespace tessel::console
