#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>

#include "archive/Format.hpp"

namespace tessel::archive {

// PieceVerifier compares the pieces of a segment's body with their checksums,
// each piece when it is first needed. A bit per piece remembers that it is
// sound; damage is found anew each time.
//
// Ownership: borrows the segment's bytes.
// Threads: all members from any number of threads. Two threads may verify the
//   same piece at the same time, with the same result.
// Cost: a test of one bit per piece; the first touch of a piece hashes it,
//   about half a microsecond for 4 KiB.
class PieceVerifier {
public:
    // Verifies all levels of checksums, but nothing of the body.
    //
    // segment    all bytes of the segment, as many as its head says
    // inArchive  offset of the segment in the archive, to name damage
    //
    // Throws DamagedArchiveException.
    PieceVerifier(std::span<const std::uint8_t> segment,
                  const SegmentHead& head, std::uint64_t inArchive);

    std::span<const std::uint8_t> body() const noexcept { return body_; }

    // Where a byte of the body is in the archive.
    std::uint64_t inArchive(std::uint64_t bodyOffset) const noexcept {
        return bodyInArchive_ + bodyOffset;
    }

    // Makes sure that the bytes of the body from begin up to, but without, end
    // are sound. They must be within the body. Throws
    // DamagedArchiveException.
    void require(std::uint64_t begin, std::uint64_t end) const {
        if (begin == end) return;
        const std::uint64_t last = (end - 1) >> pieceShift_;
        for (std::uint64_t piece = begin >> pieceShift_; piece <= last; ++piece)
            if (!isKnownSound(piece)) [[unlikely]]
                verify(piece);
    }

    std::uint64_t pieces() const noexcept { return pieceCount_; }
    // Bytes of the body up to this piece.
    std::uint64_t startOf(std::uint64_t piece) const noexcept {
        return piece << pieceShift_;
    }
    std::uint64_t sizeOf(std::uint64_t piece) const noexcept;

    // Whether a piece is sound, whatever is remembered of it.
    bool isSound(std::uint64_t piece) const noexcept;

private:
    using Word = std::atomic<std::uint64_t>;

    // Relaxed order suffices: the bytes do not change, so the bit stands for
    // nothing but itself, and a thread that misses it only verifies again.
    bool isKnownSound(std::uint64_t piece) const noexcept {
        return (sound_[piece / 64].load(std::memory_order_relaxed) >>
                    (piece % 64) &
                1U) != 0;
    }

    void verify(std::uint64_t piece) const;
    void verifyLevels(std::span<const std::uint8_t> levels,
                      std::uint64_t levelsInArchive);

    std::span<const std::uint8_t> body_;
    std::span<const std::uint8_t> pieceSums_;  // level 0
    std::uint64_t topSum_;
    unsigned pieceShift_;
    std::uint64_t pieceCount_;
    std::uint64_t bodyInArchive_;
    std::unique_ptr<Word[]> sound_;
};

}  // namespace tessel::archive
