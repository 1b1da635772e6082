#pragma once

#include <cstddef>
#include <cstdint>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/ChildIndex.hpp"
#include "pathtree/Component.hpp"
#include "pathtree/ComponentList.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/PathTrack.hpp"

namespace tessel {

// Inserts into one path tree: it makes the nodes, and finds those that are
// there. What each operation means is said at BPathTree's operation of the
// same name; if one throws (std::bad_alloc, std::length_error), nothing has
// changed.
//
// Ownership: owns the pool that fills the tree's slabs and the index of the
//   tree's children. Borrows the nodes, which must be of this tree or of a
//   copy that lives as long.
// Threads: one.
// Cost: finding a child takes constant time on average.
class TreeInserter {
public:
    // A folder that took files: its node, whether it was stored already (the
    // root, for a folder without components, never counts as stored) and the
    // position of the first of the files.
    struct AddedBatch {
        BNode& folder;
        bool existed;
        std::uint64_t firstFile;
    };

    // A root for a new tree. Forgets the nodes of the former one.
    BNodePtr makeRoot();

    // Makes a node and appends it to the children of parent, unseen.
    BNode& add(BNode& parent, ComponentView value, NodePool::Kind kind) {
        return pool_.add(parent, value, kind);
    }

    bool addPath(BNode& root, Components& components, PathTrack& pathTrack);

    AddedBatch addBatch(BNode& root, Components& folderComponents,
                        Components& fileNames, PathTrack& pathTrack);
    // The same from packed lists, which are only read.
    AddedBatch addBatch(BNode& root, const ComponentList& folderComponents,
                        const ComponentList& fileNames, PathTrack& pathTrack);

    // Appends files to a folder that was found before; returns the position
    // of the first.
    std::uint64_t addFiles(BNode& folder, const ComponentList& fileNames);

    // Releases the memory of the index, if it holds no more than
    // `maxChildren` children. It comes back by itself when it is needed.
    void releaseIndex(std::size_t maxChildren = ~std::size_t{0}) noexcept;

    // Heap bytes of the index.
    std::size_t indexBytes() const noexcept { return index_.memoryBytes(); }

private:
    template <class Folder, class Files>
    AddedBatch insertBatch(BNode& root, Folder& components, Files& fileNames,
                           PathTrack& pathTrack);
    template <class Files>
    std::uint64_t appendFiles(BNode& folder, const Files& fileNames);

    NodePool pool_;
    ChildIndex index_;
};

}  // namespace tessel
