#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/PathTrack.hpp"

namespace tessel {

// A list of path tracks, packed as varints: a track takes about a byte per
// position instead of eight and a vector. Read it as a vector of vectors.
//
// In the buffer a track is its length and then its positions. A varint has
// seven bits per byte, least significant first, and the high bit set on all
// bytes but the last. `starts_` holds where every `tracksPerStart`-th track
// begins.
//
// Ownership: a value; copies are independent.
// Cost: reading one track skips at most tracksPerStart - 1 others.
class PathTracks {
public:
    std::size_t size() const noexcept { return count_; }
    bool empty() const noexcept { return count_ == 0; }

    // A copy of track i, which must be below size().
    PathTrack operator[](std::size_t i) const;

    // Calls visit(position) for every position of track i, in order, without
    // a copy.
    template <class Visit>
    void visitPositions(std::size_t i, Visit visit) const {
        std::size_t at = startOf(i);
        for (std::uint64_t left = readInteger(at); left > 0; --left)
            visit(readInteger(at));
    }

    // Appends a copy of the track. If it throws, nothing is appended.
    void push_back(const PathTrack& track);

    // Makes sure that the next push_back of a track of at most `length`
    // positions does not throw.
    void reserveFor(std::size_t length);

    // Calls visit(track) for every track in order. The track is valid during
    // the call.
    template <class Visit>
    void forEach(Visit visit) const {
        PathTrack track;
        std::size_t at = 0;
        for (std::size_t i = 0; i < count_; ++i) {
            track.resize(static_cast<std::size_t>(readInteger(at)));
            for (std::uint64_t& position : track) position = readInteger(at);
            visit(static_cast<const PathTrack&>(track));
        }
    }

    // Gives back what growth reserved and is not used.
    void shrinkToFit();

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

    friend bool operator==(const PathTracks& a, const PathTracks& b) = default;

private:
    // A start costs 8 bytes, so 8 tracks share one: a byte per track.
    static constexpr std::size_t tracksPerStart = 8;
    static constexpr unsigned bitsPerVarintByte = 7;
    static constexpr std::uint8_t moreFollows = 0x80;

    std::size_t startOf(std::size_t i) const noexcept;
    void appendInteger(std::uint64_t value);
    std::uint64_t readInteger(std::size_t& at) const noexcept {
        std::uint64_t value = 0;
        for (unsigned shift = 0;; shift += bitsPerVarintByte) {
            const std::uint8_t byte = bytes_[at++];
            value |= std::uint64_t{byte & 0x7FU} << shift;
            if ((byte & moreFollows) == 0) return value;
        }
    }

    std::vector<std::uint8_t> bytes_;
    std::vector<std::uint64_t> starts_;
    std::size_t count_ = 0;
};

}  // namespace tessel
