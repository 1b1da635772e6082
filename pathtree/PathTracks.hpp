#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

namespace tessel {

// A path track: child positions from the root of the path tree down.
using PathTrack = std::vector<std::uint64_t>;

// A list of path tracks, packed: a track takes about a byte a position
// instead of eight and a vector. Read it as a vector of vectors.
//
// In the buffer a track is its length and then its positions, each as a
// variable-length integer (seven bits a byte, least significant first, the
// high bit set on all but the last). `starts` holds where every
// `tracksPerStart`-th track begins.
//
// Cost: reading one track skips at most tracksPerStart - 1 others.
class PathTracks {
public:
    std::size_t size() const noexcept { return count_; }
    bool empty() const noexcept { return count_ == 0; }

    // A copy of track i, which must be below size().
    PathTrack operator[](std::size_t i) const {
        PathTrack track;
        get(i, track);
        return track;
    }
    // The same into a track whose memory is used again.
    void get(std::size_t i, PathTrack& track) const;
    PathTrack front() const { return (*this)[0]; }
    PathTrack back() const { return (*this)[count_ - 1]; }

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
            at = read(at, track);
            visit(static_cast<const PathTrack&>(track));
        }
    }

    // Gives back what growth reserved and is not used.
    void shrinkToFit();

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

    friend bool operator==(const PathTracks& a, const PathTracks& b) = default;

private:
    static constexpr std::size_t tracksPerStart = 8;

    // Replaces track by the one that begins at `at`; returns where the next
    // one begins.
    std::size_t read(std::size_t at, PathTrack& track) const;
    std::uint64_t readInteger(std::size_t& at) const noexcept;

    std::vector<std::uint8_t> bytes_;
    std::vector<std::uint64_t> starts_;
    std::size_t count_ = 0;
};

}  // namespace tessel
