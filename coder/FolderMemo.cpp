#include "coder/FolderMemo.hpp"

#include <algorithm>
#include <functional>
#include <limits>
#include <string_view>

namespace tessel {

namespace {

constexpr std::size_t smallestTable = 64;

std::uint32_t tagOf(std::uint64_t hash) noexcept {
    return static_cast<std::uint32_t>(hash >> 32);
}

}  // namespace

std::uint64_t FolderMemo::hashOf(const PackedComponents& components) noexcept {
    const ComponentView bytes = components.bytes();
    return std::hash<std::string_view>{}(
        {reinterpret_cast<const char*>(bytes.data()), bytes.size()});
}

const FolderMemo::Folder* FolderMemo::find(const PackedComponents& components,
                                           std::uint64_t hash) const noexcept {
    if (entries.empty()) return nullptr;
    const std::size_t mask = entries.size() - 1;
    for (std::size_t at = hash & mask;; at = (at + 1) & mask) {
        const Entry& entry = entries[at];
        if (entry.folderPlusOne == 0) return nullptr;
        if (entry.tag != tagOf(hash)) continue;
        const Folder& folder = folders[entry.folderPlusOne - 1];
        if (sameComponent(folder.bytes, components.bytes())) return &folder;
    }
}

const FolderMemo::Folder* FolderMemo::likely(
    std::uint64_t hash) const noexcept {
    if (entries.empty()) return nullptr;
    const Entry& entry = entries[hash & (entries.size() - 1)];
    if (entry.folderPlusOne == 0 || entry.tag != tagOf(hash)) return nullptr;
    return &folders[entry.folderPlusOne - 1];
}

void FolderMemo::fetchEntry(std::uint64_t hash) const noexcept {
    if (!entries.empty())
        __builtin_prefetch(&entries[hash & (entries.size() - 1)]);
}

void FolderMemo::fetchFolder(std::uint64_t hash) const noexcept {
    if (const Folder* folder = likely(hash)) __builtin_prefetch(folder);
}

void FolderMemo::fetchNode(std::uint64_t hash) const noexcept {
    const Folder* folder = likely(hash);
    if (folder == nullptr) return;
    __builtin_prefetch(folder->node);
    __builtin_prefetch(folder->bytes.data());
    __builtin_prefetch(positions.data() + folder->trackStart);
}

void FolderMemo::place(Entry entry, std::uint64_t hash) noexcept {
    const std::size_t mask = entries.size() - 1;
    std::size_t at = hash & mask;
    while (entries[at].folderPlusOne != 0) at = (at + 1) & mask;
    entries[at] = entry;
}

void FolderMemo::grow() {
    std::vector<Entry> larger(std::max(smallestTable, 2 * entries.size()));
    entries.swap(larger);
    for (std::size_t i = 0; i < folders.size(); ++i)
        place({tagOf(folders[i].hash), static_cast<std::uint32_t>(i + 1)},
              folders[i].hash);
}

// What a failed step leaves behind is not reached from the table.
void FolderMemo::add(const PackedComponents& components, std::uint64_t hash,
                     BNode& node, const PathTrack& track) {
    // Positions in the table are 32 bits wide; folders beyond that are just
    // not remembered.
    if (folders.size() == std::numeric_limits<std::uint32_t>::max() - 1) return;
    if (folders.size() >= entries.size() / 2) grow();
    const std::size_t start = positions.size();
    positions.insert(positions.end(), track.begin(), track.end());
    folders.push_back({components.bytes(), &node, start, track.size(), hash});
    place({tagOf(hash), static_cast<std::uint32_t>(folders.size())}, hash);
}

}  // namespace tessel
