#include "coder/ArenaEncoder.hpp"

#include "coder/BitWriter.hpp"

namespace tessel {

static_assert(ComponentEncoder::slack <= ComponentArena::slack);

namespace {

constexpr unsigned char asciiEnd = 0x80;

// More bits than a step takes.
constexpr unsigned noStep = 0xFF;
static_assert(noStep > CodeTable::longestInline);

// Longer texts are measured before they are written: they would keep room for
// codes of the greatest length. Most file systems have no longer names.
constexpr std::size_t maxShortText = 255;

// A packed code has its length in this many low bits.
constexpr unsigned lengthBits = 8;
unsigned lengthOf(std::uint64_t code) noexcept { return code & 0xFFU; }
std::uint64_t bitsOf(std::uint64_t code) noexcept { return code >> lengthBits; }

// Bytes that a short text may take, the end of its block included.
constexpr std::size_t maxBytesFor(std::size_t units) noexcept {
    return BitWriter::blockBytes(units * CodeTable::longestInline);
}

}  // namespace

ArenaEncoder::ArenaEncoder(const HuffmanCode& code) noexcept
    : codes_(code.codes), encoder_(code) {
    ascii_.fill(noStep);
    for (char16_t unit = 0; unit < asciiEnd; ++unit)
        ascii_[unit] = packed(codes_[unit]);
}

// A code without bits is left to the ComponentEncoder, too.
ArenaEncoder::PackedCode ArenaEncoder::packed(
    const CodeTable::Entry& entry) noexcept {
    if (!entry.exists() || entry.isLong || entry.length == 0) return noStep;
    return entry.bits << lengthBits | entry.length;
}

ArenaEncoder::PackedCode ArenaEncoder::codeOf(char byte) const noexcept {
    return ascii_[static_cast<unsigned char>(byte)];
}

ArenaEncoder::PackedCode ArenaEncoder::codeOf(char16_t unit) const noexcept {
    return unit < asciiEnd ? ascii_[unit] : packed(codes_[unit]);
}

// Returns 0, with nothing appended, if the text is empty or long or has a
// character for which there is no step.
template <class Unit>
std::size_t ArenaEncoder::appendShort(std::basic_string_view<Unit> text,
                                      ComponentArena& arena) const {
    if (text.empty() || text.size() > maxShortText) return 0;
    std::uint8_t* const begin = arena.reserve(maxBytesFor(text.size()));
    BitWriter writer(begin);
    const Unit* at = text.data();
    const Unit* const end = at + text.size();
    while (at != end) {
        if (end - at >= 4) {
            const PackedCode a = codeOf(at[0]);
            const PackedCode b = codeOf(at[1]);
            const PackedCode c = codeOf(at[2]);
            const PackedCode d = codeOf(at[3]);
            const unsigned ab = lengthOf(a) + lengthOf(b);
            const unsigned cd = lengthOf(c) + lengthOf(d);
            if (ab + cd <= CodeTable::longestInline) {
                writer.put(bitsOf(a) | bitsOf(b) << lengthOf(a) |
                               (bitsOf(c) | bitsOf(d) << lengthOf(c)) << ab,
                           ab + cd);
                at += 4;
                continue;
            }
        }
        const PackedCode one = codeOf(*at++);
        if (lengthOf(one) == noStep) return 0;
        writer.put(bitsOf(one), lengthOf(one));
    }
    const auto length = static_cast<std::size_t>(writer.finish() - begin);
    arena.commit(length);
    return length;
}

std::size_t ArenaEncoder::appendAscii(std::string_view text,
                                      ComponentArena& arena) const {
    return appendShort(text, arena);
}

std::size_t ArenaEncoder::append(const std::u16string& text,
                                 ComponentArena& arena) const {
    if (const std::size_t length = appendShort<char16_t>(text, arena))
        return length;
    const std::size_t length = encoder_.bytesFor(text);
    std::uint8_t* const to = arena.extend(length);
    if (length > 0) encoder_.write(text, to);
    return length;
}

}  // namespace tessel
