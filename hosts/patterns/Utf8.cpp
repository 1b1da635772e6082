#include "hosts/patterns/Utf8.hpp"

#include "paths/PathText.hpp"

namespace tessel::patterns {

namespace {

// Most paths are ASCII; this loop takes 16 or 32 bytes per instruction.
bool isAscii(std::string_view bytes) noexcept {
    unsigned char all = 0;
    for (const char byte : bytes)
        all =
            static_cast<unsigned char>(all | static_cast<unsigned char>(byte));
    return all < 0x80;
}

}  // namespace

bool isUtf8(std::string_view bytes) noexcept {
    if (isAscii(bytes)) return true;
    while (!bytes.empty()) {
        const auto character = paths::decodeCharacter(bytes);
        // A byte that is not UTF-8 comes as a lone low surrogate.
        if (character.unitCount == 1 && character.units[0] >= 0xDC80 &&
            character.units[0] <= 0xDCFF)
            return false;
        bytes.remove_prefix(character.byteCount);
    }
    return true;
}

}  // namespace tessel::patterns
