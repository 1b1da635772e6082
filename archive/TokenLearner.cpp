#include "archive/TokenLearner.hpp"

#include <algorithm>
#include <cmath>
#include <unordered_map>
#include <utility>

#include "archive/PairCounts.hpp"
#include "archive/TokenTrie.hpp"

namespace tessel::archive {

namespace {

// Ends each piece of a sequence. No pair crosses it, and no token has this
// number.
constexpr std::uint16_t separator = 0xFFFF;

// More tokens cost more in tables than they save in codes: measured on a
// million paths drawn from all of an archive's, which would fill them.
constexpr std::size_t maxTokens = 60'000;

// Below this many bytes, learning everything at once is as fast.
constexpr std::size_t twoStageBytes = 800'000;
constexpr std::size_t firstStageShare = 8;
// The first stage ends with pairs of this count. 15 to 60 differ by 0.2 % in
// the archive's size.
constexpr double firstStageCount = 30;

// The parallel steps of a pass. Fixed, so that the parts are the same for any
// number of workers.
constexpr std::size_t shards = 16;

using Sequence = std::vector<std::uint16_t>;

class Learner {
public:
    Learner(std::span<const Piece> sample, Workers& workers);

    LearnedTokens learn(double minCount);

private:
    std::span<const Piece> shardOf(std::size_t shard) const {
        const std::size_t n = sample_.size();
        return sample_.subspan(shard * n / shards,
                               (shard + 1) * n / shards - shard * n / shards);
    }

    void cutToBytes(std::size_t share);
    void cutByTokens();
    void runRounds(double threshold, double stop, int roundsAtStop);
    void sketchPairs();
    bool addTokens(double threshold);
    void countPairs(std::uint16_t threshold);
    bool nameToken(PairTable::Entry& entry);
    void replacePairs(Sequence& sequence) const;
    const PairTable::Entry* tokenAt(const Sequence& sequence,
                                    std::size_t at) const;
    TokenUses countUses() const;

    std::span<const Piece> sample_;
    Workers& workers_;
    std::vector<std::string> tokens_;
    std::unordered_map<std::string, std::uint32_t> numbers_;
    std::vector<Sequence> sequences_{shards};
    std::vector<PairSketch> sketches_;  // [worker]; the sum is in the first
    std::vector<PairTable> tables_;     // the same
    std::uint16_t threshold_ = 0;
};

unsigned sketchBits(std::span<const Piece> sample) {
    return sample.size() < 400'000 ? 18 : 19;
}

Learner::Learner(std::span<const Piece> sample, Workers& workers)
    : sample_(sample),
      workers_(workers),
      sketches_(workers.count(), PairSketch(sketchBits(sample))),
      tables_(workers.count()) {
    for (unsigned byte = 0; byte < 256; ++byte)
        tokens_.emplace_back(1, static_cast<char>(byte));
}

LearnedTokens Learner::learn(double minCount) {
    std::size_t bytes = 0;
    for (const Piece& piece : sample_) bytes += piece.length;
    if (bytes < twoStageBytes) {
        cutToBytes(1);
        runRounds(0, minCount, 3);
    } else {
        cutToBytes(firstStageShare);
        runRounds(0, firstStageCount, 2);
        cutByTokens();
        runRounds(firstStageCount * firstStageShare / 2, minCount, 3);
    }
    TokenUses uses = countUses();
    return {std::move(tokens_), std::move(uses)};
}

// ---- Sequences ----

void Learner::cutToBytes(std::size_t share) {
    workers_.run(shards, [&](std::size_t shard, unsigned) {
        Sequence& sequence = sequences_[shard];
        const auto pieces = shardOf(shard);
        for (std::size_t i = 0; i < pieces.size(); i += share) {
            for (std::uint32_t b = 0; b < pieces[i].length; ++b)
                sequence.push_back(
                    static_cast<std::uint8_t>(pieces[i].text[b]));
            sequence.push_back(separator);
        }
    });
}

// The longest token at each place.
void Learner::cutByTokens() {
    const TokenTrie trie(tokens_);
    workers_.run(shards, [&](std::size_t shard, unsigned) {
        Sequence& sequence = sequences_[shard];
        sequence.clear();
        for (const Piece& piece : shardOf(shard)) {
            for (std::uint32_t at = 0; at < piece.length;) {
                std::uint32_t longest = 0;
                std::uint32_t end = at;
                TokenTrie::Base base = trie.root();
                std::uint32_t token = 0;
                for (std::uint32_t i = at; i < piece.length; ++i) {
                    if (!trie.step(base,
                                   static_cast<std::uint8_t>(piece.text[i]),
                                   token))
                        break;
                    if (token == TokenTrie::noToken) continue;
                    longest = token;
                    end = i + 1;
                }
                sequence.push_back(static_cast<std::uint16_t>(longest));
                at = end;
            }
            sequence.push_back(separator);
        }
    });
}

// ---- Rounds ----

// A threshold of 0 starts at half the count of the most frequent pair.
void Learner::runRounds(double threshold, double stop, int roundsAtStop) {
    sketchPairs();
    if (threshold == 0) threshold = sketches_.front().max() / 2.0;
    for (int atStop = 0; atStop < roundsAtStop; threshold /= 2) {
        if (threshold <= stop) {
            threshold = stop;
            ++atStop;
        }
        if (addTokens(threshold))
            sketchPairs();
        else if (atStop > 0)
            return;
    }
}

void Learner::sketchPairs() {
    for (PairSketch& sketch : sketches_) sketch.clear();
    workers_.run(shards, [&](std::size_t shard, unsigned worker) {
        const Sequence& sequence = sequences_[shard];
        for (std::size_t i = 1; i < sequence.size(); ++i)
            if (sequence[i - 1] != separator && sequence[i] != separator)
                sketches_[worker].add(pairOf(sequence[i - 1], sequence[i]));
    });
    for (std::size_t w = 1; w < sketches_.size(); ++w)
        sketches_.front() += sketches_[w];
}

// Makes tokens of all frequent pairs; false if there are none.
bool Learner::addTokens(double threshold) {
    threshold_ = static_cast<std::uint16_t>(
        std::min(std::ceil(threshold), double{UINT16_MAX}));
    countPairs(threshold_);
    std::vector<PairTable::Entry*> frequent;
    for (PairTable::Entry& entry : tables_.front().entries())
        if (entry.count >= threshold_) frequent.push_back(&entry);
    std::ranges::sort(frequent, [](const auto* a, const auto* b) {
        return a->count != b->count ? a->count > b->count : a->pair < b->pair;
    });
    bool any = false;
    for (PairTable::Entry* entry : frequent) any |= nameToken(*entry);
    if (any)
        workers_.run(shards, [&](std::size_t shard, unsigned) {
            replacePairs(sequences_[shard]);
        });
    return any;
}

// Counts the pairs that the sketch lets through into the first table. In a run
// of equal tokens, every second pair counts: the others overlap them.
void Learner::countPairs(std::uint16_t threshold) {
    const PairSketch& sketch = sketches_.front();
    const std::size_t expected = sketch.atLeast(threshold);
    for (PairTable& table : tables_) table.reset(expected);
    workers_.run(shards, [&](std::size_t shard, unsigned worker) {
        const Sequence& sequence = sequences_[shard];
        for (std::size_t i = 1; i < sequence.size(); ++i) {
            const std::uint16_t left = sequence[i - 1];
            const std::uint16_t right = sequence[i];
            if (left == separator || right == separator) continue;
            if (sketch[pairOf(left, right)] < threshold) continue;
            tables_[worker].add(pairOf(left, right), 1);
            if (left == right && i + 1 < sequence.size() &&
                sequence[i + 1] == left)
                ++i;
        }
    });
    for (std::size_t w = 1; w < tables_.size(); ++w)
        for (const PairTable::Entry& entry : tables_[w].entries())
            if (entry.pair != PairTable::noPair)
                tables_.front().add(entry.pair, entry.count);
}

// Different pairs can make the same token.
bool Learner::nameToken(PairTable::Entry& entry) {
    if (tokens_.size() >= maxTokens) return false;
    std::string text = tokens_[entry.pair >> 16U];
    text += tokens_[entry.pair & 0xFFFFU];
    if (text.size() > maxTokenBytes) return false;
    const auto [place, isNew] = numbers_.emplace(
        std::move(text), static_cast<std::uint32_t>(tokens_.size()));
    if (isNew) tokens_.push_back(place->first);
    entry.token = place->second;
    return true;
}

// The entry of the pair at this place, if the pair is a token now.
const PairTable::Entry* Learner::tokenAt(const Sequence& sequence,
                                         std::size_t at) const {
    if (at + 1 >= sequence.size()) return nullptr;
    if (sequence[at] == separator || sequence[at + 1] == separator)
        return nullptr;
    const TokenPair pair = pairOf(sequence[at], sequence[at + 1]);
    if (sketches_.front()[pair] < threshold_) return nullptr;
    const PairTable::Entry& entry = tables_.front().find(pair);
    return entry.token != 0 ? &entry : nullptr;
}

// Joins pairs from left to right, unless the next pair is more frequent. In a
// run of equal tokens, there is no better next pair.
void Learner::replacePairs(Sequence& sequence) const {
    std::size_t end = 0;
    const PairTable::Entry* entry = tokenAt(sequence, 0);
    for (std::size_t i = 0; i < sequence.size();) {
        const PairTable::Entry* next = tokenAt(sequence, i + 1);
        const bool nextIsBetter = entry != nullptr && next != nullptr &&
                                  sequence[i + 2] != sequence[i] &&
                                  next->count > entry->count;
        if (entry == nullptr || nextIsBetter) {
            sequence[end++] = sequence[i++];
            entry = next;
        } else {
            sequence[end++] = static_cast<std::uint16_t>(entry->token);
            i += 2;
            entry = tokenAt(sequence, i);
        }
    }
    sequence.resize(end);
}

// ---- Result ----

TokenUses Learner::countUses() const {
    std::vector<TokenUses> uses(workers_.count(), TokenUses(tokens_.size()));
    workers_.run(shards, [&](std::size_t shard, unsigned worker) {
        const std::uint16_t* token = sequences_[shard].data();
        for (const Piece& piece : shardOf(shard)) {
            const ContextTable& after =
                piece.folder ? folderContexts : nameContexts;
            std::uint8_t context = piece.context;
            for (; *token != separator; ++token) {
                uses[worker].add(TokenRef::token(*token, context));
                context =
                    after[static_cast<std::uint8_t>(tokens_[*token].back())];
            }
            ++token;
        }
    });
    for (std::size_t w = 1; w < uses.size(); ++w) uses.front() += uses[w];
    return std::move(uses.front());
}

}  // namespace

LearnedTokens learnTokens(std::span<const Piece> sample, double minCount,
                          Workers& workers) {
    return Learner(sample, workers).learn(minCount);
}

}  // namespace tessel::archive
