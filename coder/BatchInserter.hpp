#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "coder/FolderCache.hpp"
#include "coder/PathNumbering.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/ComponentArena.hpp"

namespace tessel {

// Inserts encoded folders with their files into a path tree, and numbers
// them.
//
// Ownership: an object lives for one batch. It borrows the tree, the
//   numbering and the encoded lists.
// Threads: one. The tree has no locks.
// Cost: finding a folder takes constant time on average, whether it is new,
//   in the tree or in the batch itself.
class BatchInserter {
public:
    BatchInserter(BPathTree& tree, PathNumbering& numbering) noexcept
        : tree_(tree), numbering_(numbering) {}

    // Inserts folder after folder, in order; entry i of both lists is folder
    // i. Each folder becomes a partition. If memory runs out, the folders
    // before the failure are in, and nothing of the others.
    void insert(const std::vector<ComponentList>& folders,
                const std::vector<ComponentList>& files);

private:
    void insertFolder(const ComponentList& components,
                      const ComponentList& fileNames, std::uint32_t hash);
    void insertNewFolder(const ComponentList& components,
                         const ComponentList& fileNames, std::uint32_t hash);
    void beginTrackAt(const FolderCache::Folder& folder);
    void noteFolder(BNode folder, bool isEnd) noexcept;

    BPathTree& tree_;
    PathNumbering& numbering_;
    FolderCache cache_;
    PathTrack track_;  // of the current folder
};

}  // namespace tessel
