#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "archive/BitLoad.hpp"
#include "archive/Contexts.hpp"
#include "archive/Format.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {

// A decoded token: a stretch of the token text, the number of bits that its
// code took and, unless it ends the piece or has no text, the context of the
// token that follows.
class Token {
public:
    constexpr Token() = default;
    constexpr Token(TokenEntry entry, unsigned context,
                    unsigned codeBits) noexcept
        : packed_(entry.offset << 14U | entry.length << 9U |
                  std::uint32_t{entry.ends} << 8U | context << 5U | codeBits) {}

    // Stands for a token whose code is too long for a lookup.
    static constexpr Token tooLong() noexcept { return {{}, 0, 31}; }
    constexpr bool isTooLong() const noexcept { return codeBits() == 31; }

    constexpr std::uint32_t offset() const noexcept { return packed_ >> 14U; }
    constexpr unsigned length() const noexcept { return packed_ >> 9U & 31U; }
    constexpr bool ends() const noexcept { return (packed_ >> 8U & 1U) != 0; }
    constexpr unsigned context() const noexcept { return packed_ >> 5U & 7U; }
    constexpr unsigned codeBits() const noexcept { return packed_ & 31U; }
    constexpr bool isEscape() const noexcept {
        return length() == 0 && !ends();
    }

private:
    std::uint32_t packed_ = 0;
};

// What all token codes of a segment share.
struct TokenList {
    std::span<const std::uint8_t> entries;  // 3 bytes each
    std::span<const std::uint8_t> text;

    // Throws DamagedFormException unless the entries are whole, fewer than
    // 2^24, and within the text.
    void validate() const;

    std::uint32_t size() const noexcept {
        return static_cast<std::uint32_t>(entries.size() / tokenEntryBytes);
    }

    TokenEntry entry(std::uint32_t index) const noexcept {
        const std::uint8_t* const bytes =
            &entries[std::size_t{tokenEntryBytes} * index];
        return TokenEntry::fromPacked(
            std::uint32_t{loadLittle<std::uint16_t>(bytes)} |
            std::uint32_t{bytes[2]} << 16U);
    }

    // The entry as a token with a code of so many bits.
    Token token(std::uint32_t index, unsigned codeBits,
                const ContextTable& contexts) const noexcept {
        const TokenEntry found = entry(index);
        const unsigned context =
            found.length == 0 ? 0
                              : contexts[text[found.offset + found.length - 1]];
        return {found, context, codeBits};
    }
};

// The numbers of codes per length of a canonical Huffman code, and from them
// the place of a code's symbol in the order of codes.
//
// Each code is complete: whatever bits come, they start with some code.
struct CodeCounts {
    std::uint32_t size = 0;  // symbols
    unsigned shortest = 0;   // bits; 0 of a single symbol
    unsigned longest = 0;
    // By length: the last code, ones below it, and the place of the first
    // symbol less its code (which may wrap).
    std::array<std::uint32_t, maxTokenCodeBits + 1> lastCode{};
    std::array<std::uint32_t, maxTokenCodeBits + 1> placeOffset{};

    // Reads a count table and advances past it. Throws DamagedFormException
    // if there is no such code.
    static CodeCounts unpack(sixpacks::ByteCursor& cursor);

    struct Decoded {
        std::uint32_t place;
        unsigned bits;
    };

    // The symbol whose code, of at least `bits` and `shortest` bits, is at the
    // top of the word.
    Decoded decode(std::uint64_t word, unsigned bits) const noexcept {
        const auto top = static_cast<std::uint32_t>(word >> 32U);
        while (top > lastCode[bits]) ++bits;
        const std::uint32_t code =
            bits == 0 ? 0 : static_cast<std::uint32_t>(word >> (64 - bits));
        return {placeOffset[bits] + code, bits};
    }
};

// One code of tokens. Codes of at most lookupBits bits are decoded by one
// lookup, which yields the whole token and the context of the next one; longer
// codes by a search for their length and a look at the entry.
//
// Ownership: borrows the token list's bytes.
// Threads: const members from any number of threads.
// Cost: 2^lookupBits * 4 bytes and about 250 more.
template <unsigned lookupBits>
class TokenCode {
public:
    // The list must be valid and hold counts.size entries from `firstEntry`
    // on. `contexts` must outlive this object.
    TokenCode(const CodeCounts& counts, std::uint32_t firstEntry,
              const TokenList& tokens, const ContextTable& contexts);

    // The token whose code is at the top of the word.
    Token decode(std::uint64_t word) const noexcept {
        const Token token = lookup_[word >> (64 - lookupBits)];
        if (!token.isTooLong()) [[likely]]
            return token;
        return decodeLong(word);
    }

private:
    Token decodeLong(std::uint64_t word) const noexcept {
        const auto [place, bits] = counts_.decode(word, longFrom_);
        return tokens_->token(firstEntry_ + place, bits, *contexts_);
    }

    std::array<Token, std::size_t{1} << lookupBits> lookup_;
    CodeCounts counts_;
    unsigned longFrom_;  // bits of the shortest code that is too long
    std::uint32_t firstEntry_;
    const TokenList* tokens_;
    const ContextTable* contexts_;
};

template <unsigned lookupBits>
TokenCode<lookupBits>::TokenCode(const CodeCounts& counts,
                                 std::uint32_t firstEntry,
                                 const TokenList& tokens,
                                 const ContextTable& contexts)
    : counts_(counts),
      longFrom_(counts.shortest > lookupBits ? counts.shortest
                                             : lookupBits + 1),
      firstEntry_(firstEntry),
      tokens_(&tokens),
      contexts_(&contexts) {
    lookup_.fill(Token::tooLong());
    for (std::size_t next = 0; next < lookup_.size();) {
        const auto [place, bits] = counts.decode(
            std::uint64_t{next} << (64 - lookupBits), counts.shortest);
        if (bits > lookupBits) return;
        const auto end = next + (std::size_t{1} << (lookupBits - bits));
        const Token token = tokens.token(firstEntry + place, bits, contexts);
        while (next < end) lookup_[next++] = token;
    }
}

}  // namespace tessel::archive
