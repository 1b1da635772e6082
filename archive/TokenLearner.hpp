#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include "archive/FrontCoder.hpp"
#include "archive/TokenUses.hpp"
#include "archive/Workers.hpp"

namespace tessel::archive {

// Learned tokens and how often the learner's own cut of the sample uses each.
struct LearnedTokens {
    std::vector<std::string> tokens;
    TokenUses uses;
};

// Learns tokens from a sample: byte-pair encoding (Gage 1994), many pairs per
// round. In each round, every pair of neighbours that is at least as frequent
// as a threshold becomes a token; then the threshold halves, down to
// `minCount`. All single bytes are tokens, so the sample can always be cut.
//
// A large sample is learned in two stages: the frequent tokens on an eighth of
// it, which cuts the whole of it to a third; the rest on all of that.
//
// The result does not depend on the number of workers: their counts are
// summed, and ties are broken by the pairs themselves.
// Cost: some 60 ns per byte of the sample.
LearnedTokens learnTokens(std::span<const Piece> sample, double minCount,
                          Workers& workers);

}  // namespace tessel::archive
