#include "archive/TokenCoder.hpp"

#include <algorithm>
#include <cstddef>
#include <numeric>

#include "archive/CodeTables.hpp"
#include "archive/Format.hpp"
#include "archive/HuffmanLengths.hpp"
#include "archive/TokenText.hpp"

namespace tessel::archive {

namespace {

// The text of the used tokens; that of all of them if this is shorter or the
// other too long. A model's whole text is known to fit.
TokenText textOf(const TokenModel& model, const TokenUses& uses) {
    const std::size_t count = model.tokens().size();
    std::vector<bool> used(count);
    for (std::size_t t = 0; t < count; ++t) used[t] = uses.isUsed(t);
    TokenText text(model.tokens(), used, model.trie());
    if (text.text().size() <= maxTokenTextBytes) return text;
    return TokenText(model.tokens(), std::vector<bool>(count, true),
                     model.trie());
}

}  // namespace

class TokenCoder::Builder {
public:
    Builder(TokenCoder& coder, const TokenModel& model, const TokenUses& uses)
        : coder_(coder),
          model_(model),
          uses_(uses),
          text_(textOf(model, uses)) {}

    void build() {
        coder_.codes_.resize(model_.tokens().size() * contextSlots);
        for (std::uint8_t c = 0; c < tokenContextCount; ++c) addContextCode(c);
        addFirstTokenCodes();
        coder_.text_ = text_.text();
    }

private:
    void addContextCode(std::uint8_t context) {
        std::vector<Symbol> symbols;
        for (std::uint32_t t = 0; t < model_.tokens().size(); ++t)
            if (uses_.of(t, context) > 0)
                symbols.push_back({t, uses_.of(t, context)});
        // A code needs a symbol, even if no token is ever used there.
        if (uses_.literals(context) > 0 || symbols.empty())
            symbols.push_back({escape, std::max(1U, uses_.literals(context))});
        addCode(symbols, context, coder_.literalCodes_[context],
                coder_.tokenCodes_);
    }

    void addFirstTokenCodes() {
        std::array<std::vector<Symbol>, 256> byFirst;
        for (std::uint32_t t = 0; t < model_.tokens().size(); ++t)
            if (uses_.of(t, firstTokenContext) > 0)
                byFirst[static_cast<std::uint8_t>(model_.tokens()[t].front())]
                    .push_back({t, uses_.of(t, firstTokenContext)});
        std::array<std::uint8_t, 32> present{};
        std::vector<std::uint8_t> tables;
        for (unsigned b = 0; b < 256; ++b) {
            const auto byte = static_cast<std::uint8_t>(b);
            if (uses_.firstLiterals(byte) > 0)
                byFirst[b].push_back({escape, uses_.firstLiterals(byte)});
            if (byFirst[b].empty()) continue;
            present[b / 8] |= static_cast<std::uint8_t>(1U << b % 8);
            addCode(byFirst[b], firstTokenContext, coder_.firstLiteralCodes_[b],
                    tables);
        }
        coder_.firstTokenCodes_.assign(present.begin(), present.end());
        coder_.firstTokenCodes_.insert(coder_.firstTokenCodes_.end(),
                                       tables.begin(), tables.end());
    }

    // Makes the code of these symbols, and appends its table and entries.
    void addCode(const std::vector<Symbol>& symbols, std::uint8_t context,
                 Code& literal, std::vector<std::uint8_t>& tables) {
        std::vector<std::uint64_t> counts(symbols.size());
        std::ranges::transform(symbols, counts.begin(), &Symbol::count);
        const auto lengths = huffmanLengths(counts, maxTokenCodeBits);
        const auto codes = canonicalCodes(lengths);
        for (std::size_t i = 0; i < symbols.size(); ++i) {
            const Code code = {codes[i], lengths[i]};
            if (symbols[i].token == escape)
                literal = code;
            else
                coder_.codes_[symbols[i].token * contextSlots + context] = code;
        }
        CountTable::of(lengths).pack(tables);
        std::vector<std::size_t> order(symbols.size());
        std::iota(order.begin(), order.end(), std::size_t{0});
        std::ranges::stable_sort(order, {},
                                 [&](std::size_t i) { return lengths[i]; });
        for (const std::size_t i : order) addEntry(symbols[i].token);
    }

    void addEntry(std::uint32_t token) {
        TokenEntry entry;
        if (token != escape) {
            const std::string& text = model_.tokens()[token];
            entry = {text_.offsetOf(token),
                     static_cast<std::uint32_t>(tokenBody(text).size()),
                     text.ends_with('\0')};
        }
        const std::uint32_t bits = entry.packed();
        for (unsigned shift = 0; shift < 24; shift += 8)
            coder_.entries_.push_back(static_cast<std::uint8_t>(bits >> shift));
    }

    TokenCoder& coder_;
    const TokenModel& model_;
    const TokenUses& uses_;
    TokenText text_;
};

TokenCoder::TokenCoder(const TokenModel& model, const TokenUses& uses) {
    Builder(*this, model, uses).build();
}

}  // namespace tessel::archive
