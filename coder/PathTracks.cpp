#include "coder/PathTracks.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

PathTrack PathTracks::operator[](std::size_t i) const {
    PathTrack track;
    visitPositions(
        i, [&track](std::uint64_t position) { track.push_back(position); });
    return track;
}

// Where track i begins in the buffer.
std::size_t PathTracks::startOf(std::size_t i) const noexcept {
    auto at = static_cast<std::size_t>(starts_[i / tracksPerStart]);
    for (std::size_t skipped = i % tracksPerStart; skipped > 0; --skipped) {
        std::uint64_t left = readInteger(at);
        while (left > 0)
            if ((bytes_[at++] & moreFollows) == 0) --left;
    }
    return at;
}

void PathTracks::reserveFor(std::size_t length) {
    constexpr std::size_t maxIntegerBytes = 10;
    reserveGently(bytes_, (length + 1) * maxIntegerBytes);
    if (count_ % tracksPerStart == 0) reserveGently(starts_, 1);
}

void PathTracks::appendInteger(std::uint64_t value) {
    while (value >= moreFollows) {
        bytes_.push_back(static_cast<std::uint8_t>(value | moreFollows));
        value >>= bitsPerVarintByte;
    }
    bytes_.push_back(static_cast<std::uint8_t>(value));
}

void PathTracks::push_back(const PathTrack& track) {
    reserveFor(track.size());
    if (count_ % tracksPerStart == 0) starts_.push_back(bytes_.size());
    appendInteger(track.size());
    for (const std::uint64_t position : track) appendInteger(position);
    ++count_;
}

void PathTracks::shrinkToFit() {
    bytes_.shrink_to_fit();
    starts_.shrink_to_fit();
}

std::size_t PathTracks::memoryBytes() const noexcept {
    return bytes_.capacity() + starts_.capacity() * sizeof(std::uint64_t);
}

}  // namespace tessel
