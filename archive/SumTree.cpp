#include "archive/SumTree.hpp"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <algorithm>

#include "archive/Format.hpp"

namespace tessel::archive {

std::uint64_t sumOf(std::span<const std::uint8_t> bytes,
                    std::uint64_t seed) noexcept {
    return XXH64(bytes.data(), bytes.size(), seed);
}

namespace SumTree {

namespace {

std::vector<std::uint64_t> sumsOf(std::span<const std::uint8_t> bytes,
                                  unsigned pieceShift, std::uint64_t level) {
    const std::size_t pieceBytes = std::size_t{1} << pieceShift;
    std::vector<std::uint64_t> sums;
    sums.reserve(piecesIn(bytes.size(), pieceShift));
    for (std::size_t at = 0; at < bytes.size(); at += pieceBytes) {
        const auto piece =
            bytes.subspan(at, std::min(pieceBytes, bytes.size() - at));
        sums.push_back(sumOf(piece, seedOf(level, sums.size())));
    }
    return sums;
}

}  // namespace

std::uint64_t storedBytes(std::uint64_t bodyBytes,
                          unsigned pieceShift) noexcept {
    std::uint64_t total = 0;
    std::uint64_t pieces = piecesIn(bodyBytes, pieceShift);
    while (pieces > 1) {
        total += 8 * pieces;
        pieces = piecesIn(8 * pieces, pieceShift);
    }
    return total;
}

std::vector<std::uint64_t> pieceSums(std::span<const std::uint8_t> body,
                                     unsigned pieceShift) {
    return sumsOf(body, pieceShift, 0);
}

Levels levelsAbove(const std::vector<std::uint64_t>& pieceSums,
                   unsigned pieceShift) {
    Levels levels;
    std::vector<std::uint64_t> sums = pieceSums;
    for (std::uint64_t level = 1; sums.size() > 1; ++level) {
        std::vector<std::uint8_t> table;
        table.reserve(8 * sums.size());
        for (const std::uint64_t sum : sums) packUint64(sum, table);
        sums = sumsOf(table, pieceShift, level);
        levels.stored.insert(levels.stored.begin(), table.begin(),
                             table.end());
    }
    levels.top = sums.front();
    return levels;
}

}  // namespace SumTree

}  // namespace tessel::archive
