#include "archive/TokenTraining.hpp"

#include <algorithm>
#include <numeric>
#include <string>
#include <utility>
#include <vector>

#include "archive/Format.hpp"
#include "archive/TokenLearner.hpp"
#include "archive/TokenText.hpp"

namespace tessel::archive {

namespace {

// How much each level spends. Measured on a million neighbouring paths and on
// a million drawn from an archive's seven; sizes are bytes per path.
struct Effort {
    // Learned from this much, and from one byte in this many of the list.
    // Long lists repay more tokens: of seven million paths, a fixed sample of
    // two million bytes leaves 3 % in size. At the normal level, a million
    // more gain 0.5 to 1 % and take a tenth more time.
    std::uint64_t sampleBytes;
    std::uint64_t sampleEvery;
    // Pairs of fewer uses in the sample become no tokens.
    double minLearnedUses;
    // Times that the sample is cut anew to find out what tokens cost.
    int costRounds;
    // Times that the whole list is cut; the counts of one are the costs of the
    // next.
    int parses;
    ParseEffort parse;
};

Effort effortOf(ArchiveLevel level) {
    switch (level) {
        case ArchiveLevel::Fast:
            return {1'000'000, 100, 4, 1, 1, ParseEffort::Greedy};
        case ArchiveLevel::Best:
            return {12'000'000, 10, 3, 2, 2, ParseEffort::Full};
        case ArchiveLevel::Normal:
            break;
    }
    return {1'500'000, 30, 3, 1, 1, ParseEffort::Pruned};
}

// A token of fewer expected uses in the whole list costs more in tables than
// it saves: 7 to 15 differ by 0.1 %.
constexpr double minUsesInList = 10;

bool textFits(const TokenModel& model) {
    const auto& tokens = model.tokens();
    const std::size_t sum =
        std::accumulate(tokens.begin(), tokens.end(), std::size_t{0},
                        [](std::size_t bytes, const auto& token) {
                            return bytes + token.size();
                        });
    if (sum <= maxTokenTextBytes) return true;
    const TokenText text(tokens, std::vector<bool>(tokens.size(), true),
                         model.trie());
    return text.text().size() <= maxTokenTextBytes;
}

// A model whose text fits the format: rare tokens go first.
TokenModel fittingModel(const std::vector<std::string>& tokens,
                        const TokenUses& uses, double minUses) {
    TokenModel model(tokens, uses, minUses);
    while (!textFits(model)) {
        minUses *= 1.25;
        model = TokenModel(tokens, uses, minUses);
    }
    return model;
}

}  // namespace

TrainedParse trainAndParse(const FrontCoder& list, ArchiveLevel level,
                           Workers& workers,
                           FunctionRef<void(double)> progress) {
    const Effort effort = effortOf(level);
    const std::uint64_t pieceBytes = list.counts().pieceBytes;
    const std::uint64_t sampleBytes = std::min(
        pieceBytes, effort.sampleBytes + pieceBytes / effort.sampleEvery);
    const std::vector<Piece> sample = drawSample(list, sampleBytes);
    LearnedTokens learned = learnTokens(sample, effort.minLearnedUses, workers);
    progress(0.35);
    TokenModel model(learned.tokens, learned.uses, 2);
    learned = {};
    const double share =
        static_cast<double>(sampleBytes) / static_cast<double>(pieceBytes);
    const double minUses = std::max(2.0, minUsesInList * share);
    for (int round = 0; round < effort.costRounds; ++round) {
        const TokenUses uses =
            parseSample(sample, model, effort.parse, workers);
        model = fittingModel(model.tokens(), uses, minUses);
    }
    progress(0.5);
    ParsedList parsed = parseList(list, model, effort.parse, workers);
    for (int parse = 1; parse < effort.parses; ++parse) {
        progress(0.5 + 0.5 * parse / effort.parses);
        model = fittingModel(model.tokens(), parsed.uses, minUsesInList);
        parsed = parseList(list, model, effort.parse, workers);
    }
    progress(1);
    return {std::move(model), std::move(parsed)};
}

}  // namespace tessel::archive
