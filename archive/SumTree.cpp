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

std::uint64_t SumTree::pieceSum(std::span<const std::uint8_t> bytes,
                                unsigned pieceShift, std::uint64_t level,
                                std::uint64_t index) noexcept {
    const std::size_t begin = index << pieceShift;
    const std::size_t size =
        std::min(std::size_t{1} << pieceShift, bytes.size() - begin);
    return sumOf(bytes.subspan(begin, size), seedOf(level, index));
}

std::uint64_t SumTree::storedBytes(std::uint64_t bodyBytes,
                                   unsigned pieceShift) noexcept {
    std::uint64_t total = 0;
    std::uint64_t pieces = piecesIn(bodyBytes, pieceShift);
    while (pieces > 1) {
        total += 8 * pieces;
        pieces = piecesIn(8 * pieces, pieceShift);
    }
    return total;
}

SumTree::Levels SumTree::levelsAbove(std::vector<std::uint64_t> pieceSums,
                                     unsigned pieceShift) {
    Levels levels;
    std::vector<std::uint64_t>& sums = pieceSums;
    for (std::uint64_t level = 1; sums.size() > 1; ++level) {
        std::vector<std::uint8_t> table;
        table.reserve(8 * sums.size());
        for (const std::uint64_t sum : sums) packUint64(sum, table);
        sums.resize(piecesIn(table.size(), pieceShift));
        for (std::size_t i = 0; i < sums.size(); ++i)
            sums[i] = pieceSum(table, pieceShift, level, i);
        levels.stored.insert(levels.stored.begin(), table.begin(), table.end());
    }
    levels.top = sums.front();
    return levels;
}

}  // namespace tessel::archive
