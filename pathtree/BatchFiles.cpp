#include "pathtree/BatchFiles.hpp"

#include <stdexcept>

namespace tessel {

BatchFiles BatchFiles::ofRoot(const BNode& root) {
    if (root.isLeaf()) throw std::out_of_range("A track leads nowhere.");
    return {root, 0};
}

const BNode& BatchFiles::childAt(const BNode& node, std::uint64_t position) {
    const ChildList children = node.children();
    if (position >= children.size())
        throw std::out_of_range("A position leads outside the path tree.");
    return children[static_cast<std::size_t>(position)];
}

}  // namespace tessel
