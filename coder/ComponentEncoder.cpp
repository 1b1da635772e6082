#include "coder/ComponentEncoder.hpp"

#include "coder/CoderErrors.hpp"

namespace tessel {

std::size_t ComponentEncoder::bytesFor(const std::u16string& text) const {
    if (text.empty()) throw NoCodeForEmptyString();
    const CodeTable& codes = code_.codes;
    std::size_t bits = 0;
    for (const char16_t character : text) {
        const CodeTable::Entry& entry = codes[character];
        if (!entry.exists()) throw CodeNotFoundException();
        bits += entry.isLong ? code_.codeOf(character).size() : entry.length;
    }
    return BitWriter::blockBytes(bits);
}

void ComponentEncoder::write(const std::u16string& text,
                             std::uint8_t* to) const {
    const CodeTable& codes = code_.codes;
    BitWriter writer(to);
    for (const char16_t character : text) {
        const CodeTable::Entry& entry = codes[character];
        if (!entry.isLong) {
            writer.put(entry.bits, entry.length);
        } else {
            for (const bool bit : code_.codeOf(character))
                writer.put(bit ? 1 : 0, 1);
        }
    }
    writer.finish();
}

}  // namespace tessel
