#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <vector>

#include "coder/AtomicMaximum.hpp"
#include "coder/PathTracks.hpp"

namespace tessel {

// Which paths have which numbers. Numbers count from 1 in the order of
// addition. The files that one call adds under one folder are a partition;
// partition k holds the numbers above end k - 1 up to and including end k.
//
// Invariants: partitionEnds and partitionTracks have one entry per partition
//   (a loaded form may hold tracks without ends).
// Ownership: a value; copies are independent.
// Cost: 8 bytes per partition, some 5 for its track and 4 for the way to its
//   folder; a byte for 16 numbers; about 90 bytes per repeated whole path.
class PathNumbering {
public:
    // True when the path of this number repeats one that was stored before.
    bool hasDuplicate(std::uint64_t pathNumber) const {
        return !duplicates.empty() && duplicates.contains(pathNumber);
    }

    // Makes sure that the next notePartition with this many files and a track
    // of at most trackLength + 1 positions does not throw, so that tree and
    // numbering never disagree.
    void reserveForPartition(std::size_t trackLength, std::size_t fileCount);

    // Counts fileCount paths as one partition. Its track is the folder's,
    // which must have room for one more position; if the folder existed,
    // firstFileIndex is appended to it.
    void notePartition(PathTrack& track, bool existed,
                       std::uint64_t firstFileIndex, std::size_t fileCount);

    // Counts one whole path. If it existed, takes its track over. If it
    // throws (std::bad_alloc), nothing changes.
    void noteWholePath(PathTrack& track, bool existed);

    // The first partition from k on whose end is not below the number; the
    // number of partitions if there is none. Cost: a look at a table, then a
    // galloping search nearby; linear if the ends do not ascend, which only a
    // loaded form can bring about, or who changes them by hand: until
    // checkEnds, such a search may miss partitions.
    std::size_t partitionAtOrAfter(std::size_t k, std::uint64_t number) const;

    // Looks anew whether the ends ascend, after they were changed by hand.
    void checkEnds();

    // Bytes on the heap.
    std::size_t partitionBytes() const noexcept;
    std::size_t duplicateBytes() const noexcept;

    // Path number of a repeated whole path -> track of the stored one. An
    // ordered map: hostile path numbers cannot provoke hash collisions, and
    // equal content is always written as equal bytes.
    std::map<std::uint64_t, PathTrack> duplicates;
    std::vector<std::uint64_t> partitionEnds;  // pathCount after partition k
    // The folder's track; if the folder existed, the position of the
    // partition's first file is appended to it.
    PathTracks partitionTracks;
    std::uint64_t maxPartitionTrackLength = 0;
    std::uint64_t maxDuplicateTrackLength = 0;
    AtomicMaximum maxCodeBytes;  // of all components encoded so far
    std::uint64_t maxDuplicatePathNumber = 0;
    std::uint64_t nextPathNumber = 0;  // handed out since the last reset
    std::uint64_t pathCount = 0;

private:
    // starts_ has one entry per 2^shift_ numbers. This shift is the usual one.
    // A stored form can claim many numbers for few partitions: after it was
    // loaded, the shift is larger, so that there is at most one entry more
    // than there are partitions.
    static constexpr unsigned usualShift = 6;

    // The most entries that a partition of this many files adds to the table,
    // even if pathCount was set by hand to a far larger number.
    std::size_t mostStarts(std::size_t fileCount) const noexcept {
        return (fileCount >> shift_) + 1;
    }
    void noteStarts(std::size_t k, std::size_t most) noexcept;

    bool endsAscend_ = true;  // partitionEnds can be searched by halves
    // Entry j is the first partition whose end is not below j << shift_: a
    // search for a number begins there.
    std::vector<std::uint32_t> starts_;
    unsigned shift_ = usualShift;
};

}  // namespace tessel
