#include "coder/PathTracks.hpp"

#include <algorithm>

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Follows tracks through a tree. What a track shares with the one before is
// not followed again.
class TrackFollower {
public:
    explicit TrackFollower(const FolderNode& root) {
        folders_.push_back(&root);
    }

    FolderShortcuts::Shortcut follow(const PathTrack& track) {
        const auto known =
            previous_.begin() + static_cast<std::ptrdiff_t>(std::min(
                                    folders_.size() - 1, previous_.size()));
        const auto shared =
            std::mismatch(previous_.begin(), known, track.begin(), track.end());
        folders_.resize(
            static_cast<std::size_t>(shared.second - track.begin()) + 1);
        previous_ = track;
        for (auto next = shared.second; next != track.end();) {
            const FolderNode* const folder = folders_.back();
            if (*next >= folder->children().count()) return {};
            const Child child = folder->child(*next++);
            if (child.folder == nullptr && next == track.end())
                return {folder, false};
            if (child.folder == nullptr) return {};
            folders_.push_back(child.folder);
        }
        if (track.empty()) return {};
        return {folders_.back(), true};
    }

private:
    std::vector<const FolderNode*> folders_;  // the root, and those on the way
    PathTrack previous_;
};

}  // namespace

PathTrack PathTracks::operator[](std::size_t i) const {
    PathTrack track;
    read(i, track);
    return track;
}

void PathTracks::read(std::size_t i, PathTrack& track) const {
    track.clear();
    auto at = static_cast<std::size_t>(starts_[i / tracksPerStart]);
    for (std::size_t left = i % tracksPerStart + 1; left > 0; --left)
        at = readTrack(at, track);
}

std::size_t PathTracks::readTrack(std::size_t at, PathTrack& track) const {
    track.resize(static_cast<std::size_t>(readInteger(at)));
    for (std::uint64_t left = readInteger(at); left > 0; --left)
        track.push_back(readInteger(at));
    return at;
}

std::size_t PathTracks::startOf(std::size_t i) const noexcept {
    auto at = static_cast<std::size_t>(starts_[i / tracksPerStart]);
    for (std::size_t skipped = i % tracksPerStart; skipped > 0; --skipped) {
        at = skip(at, 1);
        const std::uint64_t rest = readInteger(at);
        at = skip(at, rest);
    }
    return at;
}

std::uint64_t PathTracks::lastOf(std::size_t i) const noexcept {
    std::size_t at = skip(startOf(i), 1);
    const std::uint64_t rest = readInteger(at);
    at = skip(at, rest - 1);
    return readInteger(at);
}

void PathTracks::reserveFor(std::size_t length) {
    constexpr std::size_t maxIntegerBytes = 10;
    reserveGently(bytes_, (length + 2) * maxIntegerBytes);
    if (count_ % tracksPerStart == 0) reserveGently(starts_, 1);
    last_.reserve(length);
    folders_.reserveFor(count_);
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
    std::size_t shared = 0;
    if (count_ % tracksPerStart == 0) {
        starts_.push_back(bytes_.size());
    } else if (!track.empty()) {
        const auto most = static_cast<std::ptrdiff_t>(
            std::min(track.size() - 1, last_.size()));
        const auto end = track.begin() + most;
        shared = static_cast<std::size_t>(
            std::mismatch(track.begin(), end, last_.begin()).first -
            track.begin());
    }
    appendInteger(shared);
    appendInteger(track.size() - shared);
    for (std::size_t i = shared; i < track.size(); ++i) appendInteger(track[i]);
    last_ = track;
    ++count_;
}

void PathTracks::findFolders(BNode root) {
    TrackFollower follower(*root.folder());
    std::size_t k = 0;
    if (count_ > 0) folders_.reserveFor(count_ - 1);
    forEach([&](const PathTrack& track) {
        folders_.note(k++, root, follower.follow(track));
    });
    folders_.shrinkToFit();
}

void PathTracks::shrinkToFit() {
    bytes_.shrink_to_fit();
    starts_.shrink_to_fit();
    last_.shrink_to_fit();
    folders_.shrinkToFit();
}

std::size_t PathTracks::memoryBytes() const noexcept {
    return bytes_.capacity() +
           (starts_.capacity() + last_.capacity()) * sizeof(std::uint64_t) +
           folders_.memoryBytes();
}

}  // namespace tessel
