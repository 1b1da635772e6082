#include "pathtree/PathTracks.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

constexpr unsigned bitsPerByte = 7;
constexpr std::uint8_t moreFollows = 0x80;

void appendInteger(std::vector<std::uint8_t>& out, std::uint64_t value) {
    while (value >= moreFollows) {
        out.push_back(static_cast<std::uint8_t>(value | moreFollows));
        value >>= bitsPerByte;
    }
    out.push_back(static_cast<std::uint8_t>(value));
}

}  // namespace

std::uint64_t PathTracks::readInteger(std::size_t& at) const noexcept {
    std::uint64_t value = 0;
    for (unsigned shift = 0;; shift += bitsPerByte) {
        const std::uint8_t byte = bytes_[at++];
        value |= std::uint64_t{byte & 0x7FU} << shift;
        if ((byte & moreFollows) == 0) return value;
    }
}

std::size_t PathTracks::read(std::size_t at, PathTrack& track) const {
    track.resize(static_cast<std::size_t>(readInteger(at)));
    for (std::uint64_t& position : track) position = readInteger(at);
    return at;
}

void PathTracks::get(std::size_t i, PathTrack& track) const {
    auto at = static_cast<std::size_t>(starts_[i / tracksPerStart]);
    for (std::size_t skipped = i % tracksPerStart; skipped > 0; --skipped) {
        std::uint64_t left = readInteger(at);
        while (left > 0)
            if ((bytes_[at++] & moreFollows) == 0) --left;
    }
    read(at, track);
}

void PathTracks::reserveFor(std::size_t length) {
    constexpr std::size_t longestInteger = 10;
    reserveGently(bytes_, (length + 1) * longestInteger);
    if (count_ % tracksPerStart == 0) reserveGently(starts_, 1);
}

void PathTracks::push_back(const PathTrack& track) {
    reserveFor(track.size());
    if (count_ % tracksPerStart == 0) starts_.push_back(bytes_.size());
    appendInteger(bytes_, track.size());
    for (const std::uint64_t position : track) appendInteger(bytes_, position);
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
