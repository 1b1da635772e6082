#pragma once

#include <cstdint>

#include "pathtree/FolderNode.hpp"

namespace tessel {

// The files of one batch, found by its track. Valid until paths are
// added or a pass begins.
//
// Cost: the file after the one that was asked for before is found by one step
//   from there, any other by its position.
class BatchFiles {
public:
    // The files of the folder from position `first` on.
    BatchFiles(const FolderNode& folder, std::uint64_t first) noexcept
        : block_(folder.children()),
          first_(first),
          count_(block_.count()),
          isPadded_(block_.isPadded()),
          entry_(block_.entries()) {}

    // The files under the root itself. Throws std::out_of_range if the tree
    // has no paths, or no root (null).
    static BatchFiles ofRoot(const FolderNode* root);

    // The name of the file at this offset, 1-based within the batch. Throws
    // std::out_of_range for a position outside the folder.
    ComponentView operator[](std::uint64_t offset) {
        const std::uint64_t position = first_ - 1 + offset;
        if (position == position_ + 1 && position < count_) {
            entry_ += ChildBlock::sizeOf(entry_, isPadded_);
            position_ = position;
        } else if (position != position_ || position >= count_) {
            seek(position);
        }
        return ChildBlock::read(entry_).value();
    }

    // Throws std::out_of_range if there is no such child.
    static Child childAt(const FolderNode* node, std::uint64_t position);

private:
    void seek(std::uint64_t position);

    ChildBlock block_;
    std::uint64_t first_;  // position of the batch's first file
    std::uint64_t count_;  // of the folder's children
    bool isPadded_;
    // The child that was asked for last, or the first.
    const std::uint8_t* entry_;
    std::uint64_t position_ = 0;
};

}  // namespace tessel
