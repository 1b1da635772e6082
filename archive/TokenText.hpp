#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "archive/TokenTrie.hpp"

namespace tessel::archive {

// The text that token entries point into. Tokens lie in it without their zero
// byte, and tokens that are part of longer ones take no room of their own.
class TokenText {
public:
    // The text of the tokens for which `wanted` is true. `trie` finds all of
    // the tokens.
    TokenText(const std::vector<std::string>& tokens,
              const std::vector<bool>& wanted, const TokenTrie& trie);

    const std::string& text() const noexcept { return text_; }
    // Where a wanted token is.
    std::uint32_t offsetOf(std::size_t token) const noexcept {
        return offsets_[token];
    }

private:
    static constexpr std::uint32_t notPlaced = 0xFFFFFFFF;

    void placeInside(std::size_t begin, const TokenTrie& trie);
    void placeAt(std::uint32_t token, std::size_t offset);

    std::string text_;
    std::vector<std::uint32_t> offsets_;
};

// The token's bytes without the zero byte that ends a piece.
std::string_view tokenBody(const std::string& token) noexcept;

}  // namespace tessel::archive
