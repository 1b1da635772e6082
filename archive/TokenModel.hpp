#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "archive/TokenTrie.hpp"
#include "archive/TokenUses.hpp"

namespace tessel::archive {

// The tokens that pieces may be cut into, and what each is expected to cost.
//
// Costs are in eighths of a bit: the negative logarithm of a token's share in
// its context, as an ideal code would spend it (Shannon 1948).
class TokenModel {
public:
    static constexpr std::uint32_t costUnit = 8;  // per bit
    // A token that was not seen in a context, and is not expected there. It may
    // be used all the same where everything else costs more.
    static constexpr std::uint8_t unexpected = 255;

    // Keeps, per context, the tokens that were used at least `minUses` times;
    // single bytes need two uses, or may be literals. Tokens that no context
    // keeps are dropped; the others are numbered by their uses, the most
    // frequent first, so that their costs share a few cache lines.
    TokenModel(const std::vector<std::string>& tokens, const TokenUses& uses,
               double minUses);

    const std::vector<std::string>& tokens() const noexcept { return tokens_; }
    const TokenTrie& trie() const noexcept { return trie_; }

    // The costs of a token are one row of contextSlots numbers.
    const std::uint8_t* costs() const noexcept { return costs_.data(); }

    std::uint32_t literalCost(std::uint8_t context,
                              std::uint8_t byte) const noexcept {
        return context == firstTokenContext ? firstLiteralCosts_[byte]
                                            : literalCosts_[context];
    }

private:
    struct Kept;

    void addCosts(const Kept& kept, std::uint32_t token, std::uint8_t first);

    std::vector<std::string> tokens_;
    std::vector<std::uint8_t> costs_;
    std::array<std::uint32_t, contextSlots> literalCosts_{};
    std::array<std::uint32_t, 256> firstLiteralCosts_{};
    TokenTrie trie_;
};

}  // namespace tessel::archive
