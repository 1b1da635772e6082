#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "coder/FolderShortcuts.hpp"
#include "pathtree/PathTrack.hpp"

namespace tessel {

// A list of path tracks, packed: each says in which positions it differs from
// the one before. Read it as a vector of vectors.
//
//   | shared | rest | positions |
//
//   shared     how many positions are those of the track before; never all of
//              the track's own, and 0 in every tracksPerStart-th track
//   rest       how many follow
//   positions  the rest
//
// Each number is a varint: seven bits per byte, least significant first, and
// the high bit set on all bytes but the last. `starts_` holds where every
// tracksPerStart-th track begins.
//
// Ownership: a value; copies are independent.
// Cost: reading one track reads at most tracksPerStart - 1 others. Of a track
//   whose folder is known, mostly nothing needs to be read.
class PathTracks {
public:
    std::size_t size() const noexcept { return count_; }
    bool empty() const noexcept { return count_ == 0; }

    // A copy of track i, which must be below size().
    PathTrack operator[](std::size_t i) const;
    // The same into a track that is used again.
    void read(std::size_t i, PathTrack& track) const;

    // The last position of track i, which must have one.
    std::uint64_t lastOf(std::size_t i) const noexcept;

    // Appends a copy of the track. If it throws, nothing is appended.
    void push_back(const PathTrack& track);

    // Makes sure that the next push_back of a track of at most `length`
    // positions does not throw.
    void reserveFor(std::size_t length);

    // Where the folders of the tracks are in a tree: see FolderShortcuts.
    const FolderShortcuts& folders() const noexcept { return folders_; }
    // Notes where the last track leads, of which there must be one. reserveFor
    // made sure that it does not throw.
    void noteFolder(BNode root, FolderShortcuts::Shortcut shortcut) noexcept {
        folders_.note(count_ - 1, root, shortcut);
    }
    // Follows all tracks. What was known before is forgotten. Throws
    // std::bad_alloc. Cost: the positions in which a track differs from the
    // one before.
    void findFolders(BNode root);
    void forgetFolders() noexcept { folders_ = FolderShortcuts(); }

    // Calls visit(track) for every track in order. The track is valid during
    // the call.
    template <class Visit>
    void forEach(Visit visit) const {
        PathTrack track;
        std::size_t at = 0;
        for (std::size_t i = 0; i < count_; ++i) {
            at = readTrack(at, track);
            visit(static_cast<const PathTrack&>(track));
        }
    }

    // Gives back what growth reserved and is not used.
    void shrinkToFit();

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

    // The same tracks, wherever their folders are.
    friend bool operator==(const PathTracks& a, const PathTracks& b) noexcept {
        return a.bytes_ == b.bytes_ && a.count_ == b.count_;
    }

private:
    // A start costs 8 bytes, and its track does not share: half a byte and a
    // bit more per track.
    static constexpr std::size_t tracksPerStart = 16;
    static constexpr unsigned bitsPerVarintByte = 7;
    static constexpr std::uint8_t moreFollows = 0x80;

    // Where track i begins.
    std::size_t startOf(std::size_t i) const noexcept;
    // Turns the track before into the one that begins here; returns its end.
    std::size_t readTrack(std::size_t at, PathTrack& track) const;
    // Where the integer is that follows this many others.
    std::size_t skip(std::size_t at, std::uint64_t integers) const noexcept {
        while (integers > 0)
            if ((bytes_[at++] & moreFollows) == 0) --integers;
        return at;
    }
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
    PathTrack last_;  // the last track
    FolderShortcuts folders_;
};

}  // namespace tessel
