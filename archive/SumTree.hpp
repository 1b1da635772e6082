#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace tessel::archive {

// XXH64 of the bytes with this seed: the checksum of everything stored.
std::uint64_t sumOf(std::span<const std::uint8_t> bytes,
                    std::uint64_t seed) noexcept;

// The checksums of a body, in levels (a hash tree, Merkle 1979): level 0 has
// one per piece of the body, each further level one per piece of the table
// below it, up to a level with a single checksum. That one is kept in the
// segment's head; the tables of the other levels are stored before the body,
// the highest first.
//
// Checksum i of level L has the seed L * 2^32 + i, so pieces that change
// places do not pass.
class SumTree {
public:
    SumTree() = delete;

    static constexpr std::uint64_t seedOf(std::uint64_t level,
                                          std::uint64_t index) noexcept {
        return level << 32U | index;
    }

    static constexpr std::uint64_t piecesIn(std::uint64_t bytes,
                                            unsigned pieceShift) noexcept {
        return (bytes >> pieceShift) +
               ((bytes & ((std::uint64_t{1} << pieceShift) - 1)) != 0 ? 1 : 0);
    }

    // The checksum of the piece with this index, of a body (level 0) or of the
    // table below the given level.
    static std::uint64_t pieceSum(std::span<const std::uint8_t> bytes,
                                  unsigned pieceShift, std::uint64_t level,
                                  std::uint64_t index) noexcept;

    // Bytes of all stored levels of a body of this size.
    static std::uint64_t storedBytes(std::uint64_t bodyBytes,
                                     unsigned pieceShift) noexcept;

    struct Levels {
        std::vector<std::uint8_t> stored;  // highest first
        std::uint64_t top = 0;
    };

    // All levels above the given checksums of level 0, of which there is at
    // least one.
    static Levels levelsAbove(std::vector<std::uint64_t> pieceSums,
                              unsigned pieceShift);
};

}  // namespace tessel::archive
