#pragma once

#include <cstddef>
#include <cstdint>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/ChildIndex.hpp"
#include "pathtree/ComponentList.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/PathTrack.hpp"

namespace tessel {

// Inserts into one path tree: it finds what is there, makes what is not, from
// the last component to the first, and attaches that in one step. What each
// operation means is said at BPathTree's operation of the same name; if one
// throws (std::bad_alloc, std::length_error, or std::logic_error if there is no
// node to insert under), nothing has changed.
//
// Ownership: owns the pool that fills the tree's slabs and the index of the
//   tree's children, and a share of the root that these are under, so that no
//   node that the index knows is released. Borrows all other nodes.
// Threads: one.
// Cost: finding a child takes constant time on average.
class TreeInserter {
public:
    // A folder that took files: its node, whether it was stored already (the
    // root, for a folder without components, never counts as stored), the
    // position of the first of the files, and how many of the folder's
    // components were stored.
    struct AddedBatch {
        BNode folder;
        bool existed = false;
        std::uint64_t firstFile = 0;
        std::size_t storedComponents = 0;
    };

    // A root for a new tree. Forgets the nodes of the former one.
    BNodePtr makeRoot();

    // Appends a child to the children of a node, unseen.
    void add(BNode parent, ComponentView value);

    bool addPath(BNode root, const ComponentList& components,
                 PathTrack& pathTrack);
    AddedBatch addBatch(BNode root, const ComponentList& folderComponents,
                        const ComponentList& fileNames, PathTrack& pathTrack) {
        return addBatch(root, root, folderComponents, fileNames, pathTrack);
    }
    // The same below a node that was found under the root, whose positions the
    // track already has; the components are those that follow.
    AddedBatch addBatch(BNode root, BNode start,
                        const ComponentList& components,
                        const ComponentList& fileNames, PathTrack& pathTrack);

    // Appends files to a folder that was found before; returns the position
    // of the first.
    std::uint64_t addFiles(BNode folder, const ComponentList& fileNames);

    // A node for a folder with these children; see NodePool::make.
    FolderNode* makeFolder(ComponentView name, const ChildBatch& children) {
        return pool_.make(name, children);
    }

    // Releases the memory of the index, if it holds no more than
    // `maxChildren` children. It comes back by itself when it is needed.
    void releaseIndex(std::size_t maxChildren = ~std::size_t{0}) noexcept;

    // Gives back what growth of folders has left unused below the root, if
    // any has grown since the last time. Cost: a walk over the tree then.
    void trim(BNode root);

    // Heap bytes of the index.
    std::size_t indexBytes() const noexcept { return index_.memoryBytes(); }

private:
    class Descent;
    class Chain;

    void attach(BNode parent, const ChildBatch& children);
    void indexUnder(BNode root);
    void clearIndex() noexcept;

    NodePool pool_;
    ChildIndex index_;
    BNodePtr indexedRoot_;   // of the tree whose children the index knows
    bool hasGrown_ = false;  // a folder got children after its first ones
};

}  // namespace tessel
