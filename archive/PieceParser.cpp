#include "archive/PieceParser.hpp"

#include <algorithm>

namespace tessel::archive {

namespace {

// Places looked at beyond the current one, to see whether it is passed.
constexpr std::uint32_t lookahead = 4;

std::uint8_t contextAt(const Piece& piece, std::uint32_t at) {
    if (at == 0) return piece.context;
    const ContextTable& after = piece.folder ? folderContexts : nameContexts;
    return after[static_cast<std::uint8_t>(piece.text[at - 1])];
}

}  // namespace

void PieceParser::parse(const Piece& piece, std::vector<TokenRef>& out) {
    if (effort_ == ParseEffort::Greedy) {
        parseGreedily(piece, out);
    } else {
        reset(piece.length);
        for (std::uint32_t at = 0; at < piece.length; ++at) {
            if (isPassed(at)) continue;
            const std::uint8_t context = contextAt(piece, at);
            tryLiteral(at, context, static_cast<std::uint8_t>(piece.text[at]));
            tryTokens(piece, at, context);
        }
        collect(piece, out);
    }
    out.back().markLast();
}

// ---- Cheapest way ----

void PieceParser::reset(std::uint32_t length) {
    if (ways_.size() < length + lookahead + 1)
        ways_.resize(length + lookahead + 1);
    std::fill_n(ways_.begin(), length + lookahead + 1, unreached);
    ways_[0] = 0;
}

// A place that costs no less than one shortly after it is almost never on the
// cheapest way: what follows can start from there. Leaving it out gains a
// third of the time and costs 0.1 % in size.
bool PieceParser::isPassed(std::uint32_t at) const {
    const Way* way = &ways_[at];
    if (way[0] >= unreached) return true;
    if (effort_ == ParseEffort::Full || way[1] >= unreached) return false;
    const Way after = std::min({way[1], way[2], way[3], way[4]});
    return costOf(way[0]) >= costOf(after);
}

void PieceParser::tryLiteral(std::uint32_t at, std::uint8_t context,
                             std::uint8_t byte) {
    const std::uint32_t cost =
        costOf(ways_[at]) + model_.literalCost(context, byte);
    ways_[at + 1] = std::min(ways_[at + 1], wayOf(cost, 1, literalFlag | byte));
}

void PieceParser::tryTokens(const Piece& piece, std::uint32_t at,
                            std::uint8_t context) {
    const TokenTrie& trie = model_.trie();
    const std::uint8_t* costs = model_.costs();  // none if no token exists
    const std::uint32_t start = costOf(ways_[at]);
    TokenTrie::Base base = trie.root();
    std::uint32_t token = 0;
    for (std::uint32_t i = at; i < piece.length; ++i) {
        if (!trie.step(base, static_cast<std::uint8_t>(piece.text[i]), token))
            return;
        if (token == TokenTrie::noToken) continue;
        const std::uint32_t cost =
            start + costs[token * contextSlots + context];
        ways_[i + 1] = std::min(ways_[i + 1], wayOf(cost, i + 1 - at, token));
    }
}

void PieceParser::collect(const Piece& piece,
                          std::vector<TokenRef>& out) const {
    const std::size_t start = out.size();
    for (std::uint32_t end = piece.length; end > 0;) {
        const auto step = static_cast<std::uint32_t>(ways_[end]);
        end -= step >> lengthShift;
        const std::uint8_t context = contextAt(piece, end);
        const std::uint32_t value = step & (literalFlag - 1);
        out.push_back(
            (step & literalFlag) != 0
                ? TokenRef::literal(static_cast<std::uint8_t>(value), context)
                : TokenRef::token(value, context));
    }
    std::reverse(out.begin() + static_cast<std::ptrdiff_t>(start), out.end());
}

// ---- Greedy ----

void PieceParser::parseGreedily(const Piece& piece,
                                std::vector<TokenRef>& out) const {
    const TokenTrie& trie = model_.trie();
    for (std::uint32_t at = 0; at < piece.length;) {
        const std::uint8_t context = contextAt(piece, at);
        const auto byte = static_cast<std::uint8_t>(piece.text[at]);
        TokenRef best = TokenRef::literal(byte, context);
        std::uint32_t bestCost = model_.literalCost(context, byte);
        std::uint32_t bestLength = 1;
        TokenTrie::Base base = trie.root();
        std::uint32_t token = 0;
        for (std::uint32_t i = at; i < piece.length; ++i) {
            if (!trie.step(base, static_cast<std::uint8_t>(piece.text[i]),
                           token))
                break;
            if (token == TokenTrie::noToken) continue;
            const std::uint32_t cost =
                model_.costs()[token * contextSlots + context];
            const std::uint32_t length = i + 1 - at;
            // Cost per byte, without a division.
            if (cost * bestLength > bestCost * length) continue;
            best = TokenRef::token(token, context);
            bestCost = cost;
            bestLength = length;
        }
        out.push_back(best);
        at += bestLength;
    }
}

}  // namespace tessel::archive
