#pragma once

#include <cstdint>

#include "pathtree/FolderNode.hpp"

namespace tessel {

// The files of one batch, found by its track. Valid until paths are
// added or a pass begins.
//
// Cost: a file after the one that was asked for before is found by a few
//   steps from there, any other by its position.
class BatchFiles {
public:
    // The files of the folder from position `first` on.
    BatchFiles(const FolderNode& folder, std::uint64_t first) noexcept
        : block_(folder.children()), first_(first) {}

    // The files under the root itself. Throws std::out_of_range if the tree
    // has no paths.
    static BatchFiles ofRoot(const FolderNode& root);

    // The name of the file at this offset, 1-based within the batch. Throws
    // std::out_of_range for a position outside the folder.
    ComponentView operator[](std::uint64_t offset) {
        seek(first_ - 1 + offset);
        return ChildBlock::read(block_.entries() + entryOffset_).value();
    }

    // Throws std::out_of_range if there is no such child.
    static Child childAt(const FolderNode* node, std::uint64_t position);

private:
    void seek(std::uint64_t position);

    ChildBlock block_;
    std::uint64_t first_;  // position of the batch's first file
    // The last child that was asked for, and where its entry begins.
    std::uint64_t position_ = 0;
    std::uint64_t entryOffset_ = 0;
};

}  // namespace tessel
