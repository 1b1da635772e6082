#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "archive/FrontCoder.hpp"
#include "archive/PieceParser.hpp"
#include "archive/TokenModel.hpp"
#include "archive/TokenUses.hpp"
#include "archive/Workers.hpp"

namespace tessel::archive {

// All pieces of a segment, cut into tokens.
struct ParsedList {
    // [chunk]: the steps of its pieces, one after the other. Chunks are those
    // of FrontCoder: first of names, then of folders.
    std::vector<std::vector<TokenRef>> chunks;
    TokenUses uses;
};

// Cuts all pieces of a segment on all workers. The result does not depend on
// their number.
// Cost: 4 bytes per step, some 3 steps per path; a cache per worker serves the
//   half of all pieces that have occurred shortly before.
ParsedList parseList(const FrontCoder& list, const TokenModel& model,
                     ParseEffort effort, Workers& workers);

// How often each token is used when these pieces are cut.
TokenUses parseSample(const std::vector<Piece>& sample, const TokenModel& model,
                      ParseEffort effort, Workers& workers);

// About `bytes` bytes of pieces, drawn evenly from all of the list: the same
// ones on every run.
std::vector<Piece> drawSample(const FrontCoder& list, std::uint64_t bytes);

}  // namespace tessel::archive
