#include "coder/ComponentEncoder.hpp"

#include <bit>
#include <cstring>

#include "coder/CoderErrors.hpp"

namespace tessel {

namespace {

// Writes bits to bytes, least significant first. May write seven bytes more
// than the bits need.
class BitWriter {
public:
    // Size of the block that holds this many bits.
    static std::size_t blockBytes(std::size_t bits) noexcept {
        return bits == 0 ? 0 : bits / bitsPerByte + 2;
    }

    explicit BitWriter(std::uint8_t* to) noexcept : out_(to) {}

    // Appends the `count` (at most CodeTable::longestInline) low bits; all
    // higher bits must be 0.
    void put(std::uint64_t bits, unsigned count) noexcept {
        if (heldBits_ + count >= capacity) flush();
        held_ |= bits << heldBits_;
        heldBits_ += count;
    }

    // Ends the block: the last bits, then how many they are.
    void finish() noexcept {
        flush();
        *out_++ = static_cast<std::uint8_t>(held_);
        *out_++ = static_cast<std::uint8_t>(heldBits_);
    }

private:
    static constexpr unsigned bitsPerByte = 8;
    static constexpr unsigned capacity = 64;
    static_assert(CodeTable::longestInline + bitsPerByte <= capacity);

    // Writes all whole bytes: fewer than 8 bits are held then.
    void flush() noexcept {
        static_assert(std::endian::native == std::endian::little);
        std::memcpy(out_, &held_, sizeof held_);
        const unsigned full = heldBits_ / bitsPerByte;
        out_ += full;
        held_ >>= full * bitsPerByte;
        heldBits_ %= bitsPerByte;
    }

    std::uint8_t* out_;
    std::uint64_t held_ = 0;
    unsigned heldBits_ = 0;  // below capacity
};

}  // namespace

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
