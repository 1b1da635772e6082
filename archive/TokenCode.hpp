#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "archive/BitLoad.hpp"
#include "archive/CodeTables.hpp"
#include "archive/Contexts.hpp"
#include "archive/Format.hpp"

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
                  (entry.ends ? 1U << 8U : 0U) | context << 5U | codeBits) {}

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
    // 2^24 and within the text, and the text is without the byte 0.
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

    // The entry as a token with a code of this many bits.
    Token token(std::uint32_t index, unsigned codeBits,
                const ContextTable& contexts) const noexcept {
        const TokenEntry found = entry(index);
        const unsigned context =
            found.length == 0 ? 0
                              : contexts[text[found.offset + found.length - 1]];
        return {found, context, codeBits};
    }
};

// Finds the place of a canonical code in the order of codes, from the numbers
// of codes per length.
//
// The code is complete: whatever bits come, they start with some code.
class CodePlaces {
public:
    explicit CodePlaces(const CountTable& counts) noexcept;

    struct Decoded {
        std::uint32_t place;
        unsigned bits;
    };

    // Bits of the shortest code; 0 of a single symbol.
    unsigned shortest() const noexcept { return shortest_; }

    // The code, of at least `bits` and shortest() bits, at the top of the word.
    Decoded find(std::uint64_t word, unsigned bits) const noexcept {
        const auto top = static_cast<std::uint32_t>(word >> 32U);
        // Most codes are at most three bits longer. Counting is faster than a
        // loop, whose end the processor cannot guess.
        bits += isLonger(top, bits) + isLonger(top, bits + 1) +
                isLonger(top, bits + 2);
        while (isLonger(top, bits) != 0) ++bits;
        const std::uint32_t code =
            bits == 0 ? 0 : static_cast<std::uint32_t>(word >> (64 - bits));
        return {placeOffset_[bits] + code, bits};
    }

private:
    // 1 if the code at the top has more than this many bits, otherwise 0.
    unsigned isLonger(std::uint32_t top, unsigned bits) const noexcept {
        return static_cast<unsigned>(top > lastCode_[bits]);
    }

    // By length: the last code, as the top of a word with ones after it; and
    // the place of the first code less the code itself, which may wrap.
    std::array<std::uint32_t, maxTokenCodeBits + 4> lastCode_{};
    std::array<std::uint32_t, maxTokenCodeBits + 1> placeOffset_{};
    unsigned shortest_ = 0;
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
    // The list must be valid and hold all entries of the code from `firstEntry`
    // on. `contexts` must outlive this object.
    TokenCode(const CodePlaces& places, std::uint32_t firstEntry,
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
        const auto [place, bits] = places_.find(word, longFrom_);
        return tokens_->token(firstEntry_ + place, bits, *contexts_);
    }

    std::array<Token, std::size_t{1} << lookupBits> lookup_;
    CodePlaces places_;
    unsigned longFrom_;  // bits of the shortest code that is too long
    std::uint32_t firstEntry_;
    const TokenList* tokens_;
    const ContextTable* contexts_;
};

template <unsigned lookupBits>
TokenCode<lookupBits>::TokenCode(const CodePlaces& places,
                                 std::uint32_t firstEntry,
                                 const TokenList& tokens,
                                 const ContextTable& contexts)
    : places_(places),
      longFrom_(places.shortest() > lookupBits ? places.shortest()
                                               : lookupBits + 1),
      firstEntry_(firstEntry),
      tokens_(&tokens),
      contexts_(&contexts) {
    lookup_.fill(Token::tooLong());
    for (std::size_t next = 0; next < lookup_.size();) {
        const auto [place, bits] = places.find(
            std::uint64_t{next} << (64 - lookupBits), places.shortest());
        if (bits > lookupBits) return;
        const auto end = next + (std::size_t{1} << (lookupBits - bits));
        const Token token = tokens.token(firstEntry + place, bits, contexts);
        while (next < end) lookup_[next++] = token;
    }
}

}  // namespace tessel::archive
