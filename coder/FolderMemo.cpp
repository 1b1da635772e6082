#include "coder/FolderMemo.hpp"

namespace tessel {

std::uint32_t FolderMemo::hashOf(const PackedComponents& components) noexcept {
    return HashIndex::hashOf(components.bytes());
}

const FolderMemo::Folder* FolderMemo::find(const PackedComponents& components,
                                           std::uint32_t hash) const noexcept {
    const std::size_t position = index.find(hash, [&](std::size_t candidate) {
        return sameComponent(folders[candidate].bytes, components.bytes());
    });
    return position == HashIndex::notFound ? nullptr : &folders[position];
}

// What a failed step leaves behind is not reached from the index.
void FolderMemo::add(const PackedComponents& components, std::uint32_t hash,
                     BNode& node, const PathTrack& track) {
    // More folders than the index can tell apart are just not remembered.
    if (folders.size() > HashIndex::largestPosition) return;
    const std::size_t start = positions.size();
    positions.insert(positions.end(), track.begin(), track.end());
    folders.push_back({components.bytes(), &node, start, track.size()});
    index.insert(hash, folders.size() - 1);
}

const FolderMemo::Folder* FolderMemo::likely(
    std::uint32_t hash) const noexcept {
    const std::size_t position = index.likely(hash);
    return position == HashIndex::notFound ? nullptr : &folders[position];
}

void FolderMemo::fetchEntry(std::uint32_t hash) const noexcept {
    index.fetch(hash);
}

void FolderMemo::fetchFolder(std::uint32_t hash) const noexcept {
    if (const Folder* folder = likely(hash)) __builtin_prefetch(folder);
}

void FolderMemo::fetchNode(std::uint32_t hash) const noexcept {
    const Folder* folder = likely(hash);
    if (folder == nullptr) return;
    __builtin_prefetch(folder->node);
    __builtin_prefetch(folder->bytes.data());
    __builtin_prefetch(positions.data() + folder->trackStart);
}

}  // namespace tessel
