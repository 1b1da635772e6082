#include "archive/PieceParser.hpp"

#include <algorithm>

namespace tessel::archive {

namespace {

constexpr std::uint32_t unreached = std::uint32_t{1} << 30;

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
    if (places_.size() < length + lookahead + 1)
        places_.resize(length + lookahead + 1);
    for (std::uint32_t i = 0; i <= length + lookahead; ++i)
        places_[i].cost = unreached;
    places_[0].cost = 0;
}

// A place that costs no less than one shortly after it is almost never on the
// cheapest way: what follows can start from there. Leaving it out gains a
// third of the time and costs 0.1 % in size.
bool PieceParser::isPassed(std::uint32_t at) const {
    const Place* place = &places_[at];
    if (place->cost >= unreached) return true;
    if (effort_ == ParseEffort::Full || place[1].cost >= unreached)
        return false;
    return place->cost >= std::min({place[1].cost, place[2].cost,
                                    place[3].cost, place[4].cost});
}

void PieceParser::tryLiteral(std::uint32_t at, std::uint8_t context,
                             std::uint8_t byte) {
    const std::uint32_t cost =
        places_[at].cost + model_.literalCost(context, byte);
    if (cost < places_[at + 1].cost) places_[at + 1] = {cost, 1, true, byte};
}

void PieceParser::tryTokens(const Piece& piece, std::uint32_t at,
                            std::uint8_t context) {
    const TokenTrie& trie = model_.trie();
    const std::uint8_t* costs = model_.costs() + context;
    const std::uint32_t start = places_[at].cost;
    TokenTrie::Base base = trie.root();
    std::uint32_t token = 0;
    for (std::uint32_t i = at; i < piece.length; ++i) {
        if (!trie.step(base, static_cast<std::uint8_t>(piece.text[i]), token))
            return;
        if (token == TokenTrie::noToken) continue;
        const std::uint8_t tokenCost = costs[token * contextSlots];
        const std::uint32_t cost = start + tokenCost;
        if (tokenCost != TokenModel::noCode && cost < places_[i + 1].cost)
            places_[i + 1] = {cost, static_cast<std::uint8_t>(i + 1 - at),
                              false, token};
    }
}

void PieceParser::collect(const Piece& piece,
                          std::vector<TokenRef>& out) const {
    const std::size_t start = out.size();
    for (std::uint32_t end = piece.length; end > 0;) {
        const Place& place = places_[end];
        end -= place.length;
        const std::uint8_t context = contextAt(piece, end);
        out.push_back(place.literal
                          ? TokenRef::literal(
                                static_cast<std::uint8_t>(place.token), context)
                          : TokenRef::token(place.token, context));
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
            if (cost == TokenModel::noCode ||
                cost * bestLength > bestCost * length)
                continue;
            best = TokenRef::token(token, context);
            bestCost = cost;
            bestLength = length;
        }
        out.push_back(best);
        at += bestLength;
    }
}

}  // namespace tessel::archive
