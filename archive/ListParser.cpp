#include "archive/ListParser.hpp"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <algorithm>
#include <cstring>

namespace tessel::archive {

namespace {

using Chunks = std::vector<std::vector<TokenRef>>;

// What one worker cut lately. An entry points at the piece's text and at the
// steps that it was cut into; both stay where they are.
class ParseCache {
public:
    struct Entry {
        const char* text = nullptr;
        std::uint32_t length = 0;
        std::uint32_t chunk = 0;
        std::uint32_t firstStep = 0;
        std::uint32_t steps = 0;
        std::uint8_t context = 0;
        bool folder = false;

        bool holds(const Piece& piece) const {
            return length == piece.length && context == piece.context &&
                   folder == piece.folder &&
                   std::memcmp(text, piece.text, length) == 0;
        }
    };

    // The only entry that can hold the piece.
    Entry& entryOf(const Piece& piece) {
        const std::uint64_t seed = piece.context + (piece.folder ? 8U : 0U);
        const std::uint64_t hash =
            XXH3_64bits_withSeed(piece.text, piece.length, seed);
        return entries_[hash >> (64 - bits)];
    }

private:
    // Twice as many serve 2 % more pieces, but no longer fit the second-level
    // cache.
    static constexpr unsigned bits = 16;
    std::vector<Entry> entries_{std::size_t{1} << bits};
};

// Cuts the chunks that one worker draws.
class ChunkParser {
public:
    ChunkParser(const FrontCoder& list, const TokenModel& model,
                ParseEffort effort, Chunks& chunks)
        : list_(list),
          parser_(model, effort),
          chunks_(chunks),
          uses_(model.tokens().size()) {}

    void parseNames(std::size_t chunk, std::size_t nameChunk) {
        const std::size_t begin = nameChunk * FrontCoder::chunkItems;
        const std::size_t end =
            std::min(list_.names(), begin + FrontCoder::chunkItems);
        chunks_[chunk].reserve(3 * (end - begin));
        for (std::size_t place = begin; place < end; ++place)
            if (list_.hasPiece(place)) parse(list_.namePiece(place), chunk);
    }

    void parseFolders(std::size_t chunk, std::size_t folderChunk) {
        const std::size_t begin = folderChunk * FrontCoder::chunkItems;
        const std::size_t end =
            std::min(list_.folders(), begin + FrontCoder::chunkItems);
        chunks_[chunk].reserve(4 * (end - begin));
        for (std::size_t number = begin; number < end; ++number)
            parse(list_.folderPiece(number), chunk);
    }

    const TokenUses& uses() const noexcept { return uses_; }

private:
    void parse(const Piece& piece, std::size_t chunk);

    const FrontCoder& list_;
    PieceParser parser_;
    ParseCache cache_;
    Chunks& chunks_;
    TokenUses uses_;
};

void ChunkParser::parse(const Piece& piece, std::size_t chunk) {
    std::vector<TokenRef>& steps = chunks_[chunk];
    const std::size_t first = steps.size();
    ParseCache::Entry& entry = cache_.entryOf(piece);
    if (entry.holds(piece)) {
        for (std::uint32_t i = 0; i < entry.steps; ++i)
            steps.push_back(chunks_[entry.chunk][entry.firstStep + i]);
    } else {
        parser_.parse(piece, steps);
    }
    for (std::size_t i = first; i < steps.size(); ++i) uses_.add(steps[i]);
    entry = {piece.text,
             piece.length,
             static_cast<std::uint32_t>(chunk),
             static_cast<std::uint32_t>(first),
             static_cast<std::uint32_t>(steps.size() - first),
             piece.context,
             piece.folder};
}

}  // namespace

ParsedList parseList(const FrontCoder& list, const TokenModel& model,
                     ParseEffort effort, Workers& workers) {
    const std::size_t nameChunks = FrontCoder::chunksOf(list.names());
    ParsedList result{Chunks(nameChunks + FrontCoder::chunksOf(list.folders())),
                      TokenUses(model.tokens().size())};
    std::vector<ChunkParser> parsers(
        workers.count(), ChunkParser(list, model, effort, result.chunks));
    workers.run(result.chunks.size(), [&](std::size_t chunk, unsigned worker) {
        if (chunk < nameChunks)
            parsers[worker].parseNames(chunk, chunk);
        else
            parsers[worker].parseFolders(chunk, chunk - nameChunks);
    });
    for (const ChunkParser& parser : parsers) result.uses += parser.uses();
    return result;
}

TokenUses parseSample(const std::vector<Piece>& sample, const TokenModel& model,
                      ParseEffort effort, Workers& workers) {
    constexpr std::size_t piecesPerStep = 4096;
    std::vector<TokenUses> uses(workers.count(),
                                TokenUses(model.tokens().size()));
    workers.run((sample.size() + piecesPerStep - 1) / piecesPerStep,
                [&](std::size_t step, unsigned worker) {
                    PieceParser parser(model, effort);
                    std::vector<TokenRef> steps;
                    const std::size_t end =
                        std::min(sample.size(), (step + 1) * piecesPerStep);
                    for (std::size_t i = step * piecesPerStep; i < end; ++i) {
                        steps.clear();
                        parser.parse(sample[i], steps);
                        for (const TokenRef ref : steps) uses[worker].add(ref);
                    }
                });
    for (std::size_t w = 1; w < uses.size(); ++w) uses.front() += uses[w];
    return std::move(uses.front());
}

std::vector<Piece> drawSample(const FrontCoder& list, std::uint64_t bytes) {
    const std::uint64_t all = list.counts().pieceBytes;
    const std::uint64_t drawn = std::min(bytes, all);
    std::vector<Piece> sample;
    std::uint64_t due = all / 2;
    const auto isDrawn = [&] {
        due += drawn;
        if (due < all) return false;
        due -= all;
        return true;
    };
    for (std::size_t place = 0; place < list.names(); ++place)
        if (list.hasPiece(place) && isDrawn())
            sample.push_back(list.namePiece(place));
    for (std::size_t number = 0; number < list.folders(); ++number)
        if (isDrawn()) sample.push_back(list.folderPiece(number));
    return sample;
}

}  // namespace tessel::archive
