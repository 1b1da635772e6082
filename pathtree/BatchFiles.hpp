#pragma once

#include <cstdint>

#include "pathtree/BNode.hpp"

namespace tessel {

// The files of one batch, found by its track. Valid as long as the tree.
class BatchFiles {
public:
    // The files of the folder from position `first` on.
    BatchFiles(const BNode& folder, std::uint64_t first) noexcept
        : folder_(&folder), first_(first) {}

    // The files under the root itself. Throws std::out_of_range if the tree
    // has no paths.
    static BatchFiles ofRoot(const BNode& root);

    // The name of the file at this offset, 1-based within the batch. Throws
    // std::out_of_range for a position outside the folder.
    ComponentView operator[](std::uint64_t offset) const {
        return childAt(*folder_, first_ - 1 + offset).value();
    }

    // Throws std::out_of_range if there is no such child.
    static const BNode& childAt(const BNode& node, std::uint64_t position);

private:
    const BNode* folder_;
    std::uint64_t first_;  // position of the batch's first file
};

}  // namespace tessel
