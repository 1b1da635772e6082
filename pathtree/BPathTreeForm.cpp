// The stored form of the path tree: two lists with one entry per node but
// the root, in pre-order (a node before its children, children in the
// order of insertion).
//
//   structure   the node's code: see NodeCode.hpp
//   values      the node's encoded component

#include <algorithm>

#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/NodeCode.hpp"
#include "pathtree/NodeWalk.hpp"
#include "pathtree/TreeBuilder.hpp"
#include "pathtree/containers.hpp"

namespace tessel {

std::size_t BPathTree::serialize(std::vector<std::uint8_t>& structure,
                                 Components& values) const {
    std::size_t maxChildren = root->children().size();
    for (NodeWalk walk(*root); walk.next();) {
        const ComponentView value = walk.node().value();
        values.emplace_back(value.begin(), value.end());
        structure.push_back(nodecode::of(walk));
        maxChildren = std::max(maxChildren, walk.childCount());
    }
    return maxChildren;
}

std::size_t BPathTree::deserialize(std::vector<std::uint8_t>& structure,
                                   Components& values) {
    TreeBuilder builder(*this, structure);
    if (structure.empty() && values.empty()) return 0;
    for (std::size_t i = 0; !builder.complete(); ++i) {
        if (i == values.size()) throw DamagedFormException();
        try {
            builder.add(values[i]);
        } catch (const UnknownNodeTypeException&) {
            releaseContents(values[i]);  // it became a node all the same
            throw;
        }
        releaseContents(values[i]);
    }
    return builder.leaves();
}

}  // namespace tessel
