#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "archive/FrontCoder.hpp"
#include "archive/TokenModel.hpp"
#include "archive/TokenUses.hpp"

namespace tessel::archive {

// How hard a parser tries.
enum class ParseEffort : std::uint8_t {
    // Takes the token that costs least per byte, once and for all.
    Greedy,
    // The cheapest way, but places that are cheaper to pass are not tried.
    Pruned,
    // The cheapest way.
    Full
};

// Cuts pieces into tokens at the least cost: a shortest-path parse (Viterbi
// 1967) over the places of a piece, where each token that matches is an edge.
//
// Ownership: borrows the model; keeps its scratch memory from piece to piece.
// Threads: one parser per thread.
// Cost: the number of tokens that match anywhere in the piece.
class PieceParser {
public:
    PieceParser(const TokenModel& model, ParseEffort effort)
        : model_(model), effort_(effort) {}

    // Appends the steps of the piece; the last one is marked.
    void parse(const Piece& piece, std::vector<TokenRef>& out);

private:
    // The cheapest known way to a place.
    struct Place {
        std::uint32_t cost;
        std::uint8_t length;  // of the last step
        bool literal;         // what the last step is
        std::uint32_t token;
    };

    void parseGreedily(const Piece& piece, std::vector<TokenRef>& out) const;
    void reset(std::uint32_t length);
    bool isPassed(std::uint32_t at) const;
    void tryLiteral(std::uint32_t at, std::uint8_t context, std::uint8_t byte);
    void tryTokens(const Piece& piece, std::uint32_t at, std::uint8_t context);
    void collect(const Piece& piece, std::vector<TokenRef>& out) const;

    const TokenModel& model_;
    ParseEffort effort_;
    std::vector<Place> places_;
};

}  // namespace tessel::archive
