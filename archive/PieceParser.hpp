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
    // The cheapest known way to a place, as one number, so that the cheaper of
    // two is the lesser: | cost (32 bits) | its last step (32 bits) |. A step
    // is | length (5 bits) | literal (1 bit) | token or byte (26 bits) |.
    using Way = std::uint64_t;
    static constexpr unsigned costShift = 32;
    static constexpr unsigned lengthShift = 27;
    static constexpr std::uint32_t literalFlag = std::uint32_t{1} << 26;
    static constexpr Way unreached = Way{1} << 62;

    static std::uint32_t costOf(Way way) {
        return static_cast<std::uint32_t>(way >> costShift);
    }
    static Way wayOf(std::uint32_t cost, std::uint32_t length,
                     std::uint32_t step) {
        return Way{cost} << costShift | (length << lengthShift | step);
    }

    void parseGreedily(const Piece& piece, std::vector<TokenRef>& out) const;
    void reset(std::uint32_t length);
    bool isPassed(std::uint32_t at) const;
    void tryLiteral(std::uint32_t at, std::uint8_t context, std::uint8_t byte);
    void tryTokens(const Piece& piece, std::uint32_t at, std::uint8_t context);
    void collect(const Piece& piece, std::vector<TokenRef>& out) const;

    const TokenModel& model_;
    ParseEffort effort_;
    std::vector<Way> ways_;  // [place], and some beyond the end
};

}  // namespace tessel::archive
