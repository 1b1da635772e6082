#include "archive/TokenModel.hpp"

#include <algorithm>
#include <cmath>

namespace tessel::archive {

namespace {

// No literal is taken to cost more, not even where none was seen.
constexpr double maxLiteralBits = 18;
constexpr double maxFirstLiteralBits = 12;
// No token is taken to cost less: Huffman codes spend whole bits, but a token
// that is nearly certain may be the only one of its first byte.
constexpr double minTokenBits = 0.3;
constexpr double minFirstTokenBits = 0.05;
// What stands for "not seen, but possible".
constexpr double unseenUses = 0.7;

std::uint32_t costOf(double bits) {
    return static_cast<std::uint32_t>(std::lround(bits * TokenModel::costUnit));
}

std::uint8_t tokenCost(double bits) {
    return static_cast<std::uint8_t>(
        std::min<std::uint32_t>(costOf(bits), TokenModel::unexpected - 1));
}

double literalBits(std::uint64_t total, std::uint64_t literals, double limit) {
    return std::min(limit,
                    std::log2(static_cast<double>(total) /
                              (static_cast<double>(literals) + unseenUses)));
}

}  // namespace

// Which uses keep their code, and the sums that costs are shares of.
struct TokenModel::Kept {
    Kept(const std::vector<std::string>& tokens, const TokenUses& uses,
         double minUses);

    std::uint32_t of(std::size_t token, std::size_t context) const {
        return counts[token * contextSlots + context];
    }

    // Counts what a token is used in a context, as itself or as a literal.
    void add(const std::string& text, std::size_t token, std::size_t context,
             std::uint32_t count, double minUses);

    // Tokens that some context keeps.
    std::vector<std::uint32_t> mostUsedFirst() const;

    std::vector<std::uint32_t> counts;
    std::array<std::uint64_t, contextSlots> totals{};
    std::array<std::uint64_t, contextSlots> literals{};
    std::array<std::uint64_t, 256> firstTotals{};
    std::array<std::uint64_t, 256> firstLiterals{};
};

TokenModel::Kept::Kept(const std::vector<std::string>& tokens,
                       const TokenUses& uses, double minUses)
    : counts(tokens.size() * contextSlots) {
    totals.fill(1);
    firstTotals.fill(1);
    for (std::size_t t = 0; t < tokens.size(); ++t)
        for (std::size_t c = 0; c < contextSlots; ++c)
            if (uses.of(t, c) > 0) add(tokens[t], t, c, uses.of(t, c), minUses);
}

void TokenModel::Kept::add(const std::string& text, std::size_t token,
                           std::size_t context, std::uint32_t count,
                           double minUses) {
    const bool isByte = text.size() == 1;
    const bool isFirst = context == firstTokenContext;
    const auto first = static_cast<std::uint8_t>(text.front());
    // After a shared prefix, a byte alone is always the literal.
    const bool keep = isByte ? !isFirst && count >= 2 : count >= minUses;
    if (!keep && !isByte) return;
    (isFirst ? firstTotals[first] : totals[context]) += count;
    if (keep)
        counts[token * contextSlots + context] = count;
    else
        (isFirst ? firstLiterals[first] : literals[context]) += count;
}

std::vector<std::uint32_t> TokenModel::Kept::mostUsedFirst() const {
    std::vector<std::uint64_t> uses(counts.size() / contextSlots);
    for (std::size_t i = 0; i < counts.size(); ++i)
        uses[i / contextSlots] += counts[i];
    std::vector<std::uint32_t> order;
    for (std::uint32_t t = 0; t < uses.size(); ++t)
        if (uses[t] > 0) order.push_back(t);
    std::ranges::stable_sort(order, [&](std::uint32_t a, std::uint32_t b) {
        return uses[a] > uses[b];
    });
    return order;
}

TokenModel::TokenModel(const std::vector<std::string>& tokens,
                       const TokenUses& uses, double minUses) {
    const Kept kept(tokens, uses, minUses);
    for (std::size_t c = 0; c < tokenContextCount; ++c)
        literalCosts_[c] = costOf(
            literalBits(kept.totals[c], kept.literals[c], maxLiteralBits) + 8);
    for (std::size_t b = 0; b < 256; ++b)
        firstLiteralCosts_[b] = costOf(literalBits(
            kept.firstTotals[b], kept.firstLiterals[b], maxFirstLiteralBits));
    for (const std::uint32_t t : kept.mostUsedFirst()) {
        tokens_.push_back(tokens[t]);
        addCosts(kept, t, static_cast<std::uint8_t>(tokens[t].front()));
    }
    trie_ = TokenTrie(tokens_);
}

// The costs of a kept token.
void TokenModel::addCosts(const Kept& kept, std::uint32_t token,
                          std::uint8_t first) {
    for (std::size_t c = 0; c < contextSlots; ++c) {
        const std::uint32_t count = kept.of(token, c);
        const bool isFirst = c == firstTokenContext;
        const std::uint64_t total =
            isFirst ? kept.firstTotals[first] : kept.totals[c];
        costs_.push_back(
            count == 0 ? unexpected
                       : tokenCost(std::max(
                             isFirst ? minFirstTokenBits : minTokenBits,
                             std::log2(static_cast<double>(total) / count))));
    }
}

}  // namespace tessel::archive
