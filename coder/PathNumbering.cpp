#include "coder/PathNumbering.hpp"

#include <algorithm>
#include <limits>
#include <utility>

#include "pathtree/containers.hpp"

namespace tessel {

void PathNumbering::reserveForPartition(std::size_t trackLength,
                                        std::size_t fileCount) {
    reserveGently(partitionEnds, 1);
    partitionTracks.reserveFor(trackLength + 1);
    reserveGently(starts_, mostStarts(fileCount));
}

// Brings the table up to partition k, by at most this many entries. There is
// room. A table that lags behind makes searches longer, not wrong.
void PathNumbering::noteStarts(std::size_t k, std::size_t most) noexcept {
    if (k > std::numeric_limits<std::uint32_t>::max()) return;
    for (; most > 0 && starts_.size() <= partitionEnds[k] >> shift_; --most)
        starts_.push_back(static_cast<std::uint32_t>(k));
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
    noteStarts(partitionEnds.size() - 1, mostStarts(fileCount));
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
    if (k >= partitionEnds.size()) return partitionEnds.size();
    const auto begin = partitionEnds.begin();
    const auto at = [begin](std::size_t i) {
        return begin + static_cast<std::ptrdiff_t>(i);
    };
    const auto holds = [number](std::uint64_t end) { return end >= number; };
    if (!endsAscend_)
        return static_cast<std::size_t>(
            std::find_if(at(k), partitionEnds.end(), holds) - begin);
    if (holds(*at(k))) return k;
    if (!starts_.empty()) {
        const std::size_t start = starts_[std::min<std::uint64_t>(
            number >> shift_, starts_.size() - 1)];
        partitionTracks.folders().prefetch(start);
        // Not if the table lags behind, or the ends were changed by hand.
        if (start > k && start <= partitionEnds.size() &&
            !holds(*at(start - 1)))
            k = start;
    }
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
    starts_.clear();
    shift_ = usualShift;
    if (!endsAscend_ || partitionEnds.empty()) return;
    // Not more entries than a form of that many bytes may ask for.
    const std::uint64_t last = partitionEnds.back();
    const std::uint64_t most = partitionEnds.size() + 1;
    while (last >> shift_ >= most) ++shift_;
    starts_.reserve(static_cast<std::size_t>((last >> shift_) + 1));
    for (std::size_t k = 0; k < partitionEnds.size(); ++k)
        noteStarts(k, starts_.capacity() - starts_.size());
}

std::size_t PathNumbering::partitionBytes() const noexcept {
    return partitionTracks.memoryBytes() +
           partitionEnds.capacity() * sizeof(std::uint64_t) +
           starts_.capacity() * sizeof(std::uint32_t);
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
