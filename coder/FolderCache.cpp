#include "coder/FolderCache.hpp"

namespace tessel {

std::uint32_t FolderCache::hashOf(const ComponentList& components) noexcept {
    return HashIndex::hashOf(components.bytes());
}

const FolderCache::Folder* FolderCache::find(
    const ComponentList& components, std::uint32_t hash) const noexcept {
    const std::size_t position = index_.find(hash, [&](std::size_t candidate) {
        return sameComponent(folders_[candidate].bytes, components.bytes());
    });
    return position == HashIndex::notFound ? nullptr : &folders_[position];
}

void FolderCache::reserveFor(std::size_t depth, std::size_t above) {
    const std::size_t positions = positions_.size() + depth;
    if (positions > positions_.capacity()) positions_.reserve(2 * positions);
    const std::size_t folders = folders_.size() + 1 + above;
    if (folders > folders_.capacity()) folders_.reserve(2 * folders);
    index_.reserveMore(1 + above);
}

void FolderCache::add(const ComponentList& components, std::uint32_t hash,
                      BNode node, const PathTrack& track) {
    const std::size_t start = positions_.size();
    positions_.insert(positions_.end(), track.begin(), track.end());
    addFolder({components.bytes(), node, start, track.size()}, hash);
}

// Its track is the beginning of the other's.
void FolderCache::addAbove(const ComponentList& components, std::uint32_t hash,
                           BNode node) {
    addFolder({components.bytes(), node, folders_.back().trackStart,
               components.size()},
              hash);
}

// What a failed step leaves behind is not reached from the index.
void FolderCache::addFolder(const Folder& folder, std::uint32_t hash) {
    // More folders than the index can tell apart are not cached.
    if (folders_.size() > HashIndex::maxPosition) return;
    folders_.push_back(folder);
    index_.insert(hash, folders_.size() - 1);
}

const FolderCache::Folder* FolderCache::inHomeSlot(
    std::uint32_t hash) const noexcept {
    const std::size_t position = index_.homeSlot(hash);
    return position == HashIndex::notFound ? nullptr : &folders_[position];
}

void FolderCache::prefetchEntry(std::uint32_t hash) const noexcept {
    index_.prefetch(hash);
}

void FolderCache::prefetchFolder(std::uint32_t hash) const noexcept {
    if (const Folder* folder = inHomeSlot(hash)) __builtin_prefetch(folder);
}

void FolderCache::prefetchNode(std::uint32_t hash) const noexcept {
    const Folder* folder = inHomeSlot(hash);
    if (folder == nullptr) return;
    folder->node.prefetch();
    __builtin_prefetch(folder->bytes.data());
    __builtin_prefetch(positions_.data() + folder->trackStart);
}

}  // namespace tessel
