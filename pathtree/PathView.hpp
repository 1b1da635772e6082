#pragma once

#include <cstddef>
#include <span>

#include "pathtree/Component.hpp"

namespace tessel {

// The path that a pass is at: views of the tree, valid during the visit.
struct PathView {
    std::span<const Component> folders;
    ComponentView name;
    // The number of leading folders that are the same nodes as in the path
    // before, which this tree visited in the same pass: their text need not be
    // decoded anew.
    std::size_t unchangedFolders;
};

}  // namespace tessel
