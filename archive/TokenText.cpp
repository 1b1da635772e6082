#include "archive/TokenText.hpp"

#include <algorithm>
#include <string_view>

namespace tessel::archive {

std::string_view tokenBody(const std::string& token) noexcept {
    std::string_view body = token;
    if (body.ends_with('\0')) body.remove_suffix(1);
    return body;
}

// Longest first: whatever is part of another token is placed with it.
TokenText::TokenText(const std::vector<std::string>& tokens,
                     const std::vector<bool>& wanted, const TokenTrie& trie)
    : offsets_(tokens.size(), notPlaced) {
    std::vector<std::uint32_t> order;
    for (std::uint32_t t = 0; t < tokens.size(); ++t)
        if (wanted[t]) order.push_back(t);
    std::ranges::stable_sort(order, [&](std::uint32_t a, std::uint32_t b) {
        return tokenBody(tokens[a]).size() > tokenBody(tokens[b]).size();
    });
    for (const std::uint32_t token : order) {
        if (offsets_[token] != notPlaced) continue;
        const std::size_t begin = text_.size();
        text_ += tokenBody(tokens[token]);
        placeAt(token, begin);
        placeInside(begin, trie);
    }
}

void TokenText::placeAt(std::uint32_t token, std::size_t offset) {
    if (token != TokenTrie::noToken && offsets_[token] == notPlaced)
        offsets_[token] = static_cast<std::uint32_t>(offset);
}

// Places all tokens that occur in the text from `begin` on.
void TokenText::placeInside(std::size_t begin, const TokenTrie& trie) {
    for (std::size_t at = begin; at < text_.size(); ++at) {
        TokenTrie::Base base = trie.root();
        std::uint32_t token = 0;
        for (std::size_t i = at; i < text_.size(); ++i) {
            if (!trie.step(base, static_cast<std::uint8_t>(text_[i]), token))
                break;
            placeAt(token, at);
            TokenTrie::Base ended = base;
            if (trie.step(ended, 0, token)) placeAt(token, at);
        }
    }
}

}  // namespace tessel::archive
