#include "coder/PathNumbering.hpp"

#include <algorithm>
#include <utility>

#include "pathtree/containers.hpp"

namespace tessel {

void PathNumbering::reserveForPartition(std::size_t trackLength) {
    reserveGently(partitionEnds, 1);
    partitionTracks.reserveFor(trackLength + 1);
}

void PathNumbering::notePartition(PathTrack& track, bool existed,
                                  std::uint64_t firstFileIndex,
                                  std::size_t fileCount) {
    if (existed) {
        track.push_back(firstFileIndex);
        maxPartitionTrackLength =
            std::max<std::uint64_t>(maxPartitionTrackLength, track.size());
    }
    pathCount += fileCount;
    endsAscend_ = endsAscend_ &&
                  (partitionEnds.empty() || partitionEnds.back() <= pathCount);
    partitionEnds.push_back(pathCount);
    partitionTracks.push_back(track);
}

void PathNumbering::noteWholePath(PathTrack& track, bool existed) {
    const std::uint64_t number = pathCount + 1;
    if (existed) {
        const std::uint64_t length = track.size();
        duplicates[number] = std::move(track);
        maxDuplicateTrackLength = std::max(maxDuplicateTrackLength, length);
        maxDuplicatePathNumber = std::max(maxDuplicatePathNumber, number);
    }
    pathCount = number;
}

std::size_t PathNumbering::partitionAtOrAfter(std::size_t k,
                                              std::uint64_t number) const {
    const auto begin = partitionEnds.begin();
    const auto at = [begin](std::size_t i) {
        return begin + static_cast<std::ptrdiff_t>(i);
    };
    const auto holds = [number](std::uint64_t end) { return end >= number; };
    if (!endsAscend_)
        return static_cast<std::size_t>(
            std::find_if(at(k), partitionEnds.end(), holds) - begin);
    std::size_t stride = 1;
    while (stride < partitionEnds.size() - k && !holds(*at(k + stride - 1))) {
        k += stride;
        stride *= 2;
    }
    const std::size_t last = std::min(k + stride, partitionEnds.size());
    return static_cast<std::size_t>(std::lower_bound(at(k), at(last), number) -
                                    begin);
}

void PathNumbering::checkEnds() {
    endsAscend_ = std::is_sorted(partitionEnds.begin(), partitionEnds.end());
}

std::size_t PathNumbering::partitionBytes() const noexcept {
    return partitionTracks.memoryBytes() +
           partitionEnds.capacity() * sizeof(std::uint64_t);
}

// A node of the map has a color and three links, and the allocator adds a
// header and rounds up; so it does for each track.
std::size_t PathNumbering::duplicateBytes() const noexcept {
    constexpr std::size_t nodeBytes =
        sizeof(decltype(duplicates)::value_type) + 6 * sizeof(void*);
    constexpr std::size_t trackOverhead = 2 * sizeof(void*);
    std::size_t bytes = duplicates.size() * nodeBytes;
    for (const auto& [number, track] : duplicates)
        bytes += track.capacity() * sizeof(std::uint64_t) + trackOverhead;
    return bytes;
}

}  // namespace tessel
