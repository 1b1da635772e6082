#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "pathtree/BNode.hpp"
#include "pathtree/ComponentList.hpp"
#include "pathtree/HashIndex.hpp"
#include "pathtree/PathTrack.hpp"

namespace tessel {

// Where the folders of one batch are in the path tree, so that a folder that
// comes again is found in one step instead of level by level: a list in
// random order names most of its folders again and again.
//
// The folders above them are found, too, so that a new folder needs no search
// from the root down.
//
// Ownership: borrows the folders' bytes and the nodes, which must outlive it.
// Cost: constant time on average; about 60 bytes and 8 bytes per level for
//   each different folder.
class FolderCache {
public:
    struct Folder {
        ComponentView bytes;  // of its packed components
        BNode node;
        std::size_t trackStart = 0;
        std::size_t trackLength = 0;
    };

    // A hash of the folder's components, to be handed to find and add.
    static std::uint32_t hashOf(const ComponentList& components) noexcept;

    // The folder of these components, or nullptr if it was not added. Valid
    // until the next add.
    const Folder* find(const ComponentList& components,
                       std::uint32_t hash) const noexcept;

    // Makes sure that adding a folder of this many components, and this many
    // folders above it, does not throw.
    void reserveFor(std::size_t depth, std::size_t above);

    // Adds a folder that find did not find. If it throws (std::bad_alloc),
    // nothing changes.
    void add(const ComponentList& components, std::uint32_t hash, BNode node,
             const PathTrack& track);
    // Adds a folder that is above the one that was added last, and that find
    // did not find: the folder of its first components.
    void addAbove(const ComponentList& components, std::uint32_t hash,
                  BNode node);

    // Prefetch what a later find will touch, one dependent step each: call
    // them in this order, some folders apart. They change nothing and may be
    // left out.
    void prefetchEntry(std::uint32_t hash) const noexcept;
    void prefetchFolder(std::uint32_t hash) const noexcept;
    void prefetchNode(std::uint32_t hash) const noexcept;

    std::span<const std::uint64_t> trackOf(const Folder& folder) const {
        return {positions_.data() + folder.trackStart, folder.trackLength};
    }

private:
    void addFolder(const Folder& folder, std::uint32_t hash);
    // The folder in the slot that find looks at first, if it may be the one.
    const Folder* inHomeSlot(std::uint32_t hash) const noexcept;

    HashIndex index_;  // positions in folders_
    std::vector<Folder> folders_;
    std::vector<std::uint64_t> positions_;  // all tracks, one after the other
};

}  // namespace tessel
