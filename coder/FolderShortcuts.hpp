#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/BNodePtr.hpp"

namespace tessel {

// FolderShortcuts knows where the folders of tracks are in memory, so that a
// reader begins at the folder and goes up, instead of searching every folder
// on the way down. What it does not know, the track says.
//
//   entry     | the folder's node is
//   ----------+-----------------------------------------------------------
//   0         | not known
//   2 * n     | n steps of NodeSlab::nodeAlignment after the root's node, or
//             | before it; the track's last position is that of a child
//   2 * n + 1 | the same; the track ends at the folder itself
//
// Nodes that are more than 4 GiB away from the root's are not known.
//
// Invariants: an entry says what following the track from the root says, as
//   folders stay folders and children keep their positions.
// Ownership: a value. Keeps the root alive, so that no other tree can have
//   its address.
// Cost: 4 bytes per track.
class FolderShortcuts {
public:
    struct Shortcut {
        const FolderNode* folder = nullptr;  // null if it is not known
        bool isEnd = false;                  // the track ends at the folder
    };

    // Makes sure that the next note for track k does not throw.
    void reserveFor(std::size_t k);
    // Notes that track k leads to this folder in the tree of this root. What
    // is known of another root's tree, or of later tracks, is forgotten. The
    // root must be a folder.
    void note(std::size_t k, BNode root, Shortcut shortcut) noexcept;

    // Where track k leads in the tree of this root; null has none.
    Shortcut find(std::size_t k, const FolderNode* root) const noexcept {
        if (k >= entries_.size() || root_->folder() != root) return {};
        const std::int32_t entry = entries_[k];
        if (entry == unknown) return {};
        // Rounds down, for entries below 0, too.
        return {root->atSteps(entry >> 1), (entry & 1) != 0};
    }

    // Prefetches what find will look at.
    void prefetch(std::size_t k) const noexcept {
        if (k < entries_.size()) __builtin_prefetch(entries_.data() + k);
    }

    void shrinkToFit() { entries_.shrink_to_fit(); }
    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return entries_.capacity() * sizeof(std::int32_t);
    }

private:
    static constexpr std::int32_t unknown = 0;

    BNodePtr root_;  // there is one if there are entries
    std::vector<std::int32_t> entries_;
};

}  // namespace tessel
