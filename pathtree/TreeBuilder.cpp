#include "pathtree/TreeBuilder.hpp"

#include "packing/sixpacks.hpp"

namespace tessel {

namespace {

// The number of children of the root and of each folder, in pre-order, as
// far as the codes go.
std::vector<std::uint32_t> countChildren(std::span<const std::uint8_t> codes) {
    std::vector<std::uint32_t> counts{0};
    std::vector<std::size_t> open{0};
    for (const std::uint8_t code : codes) {
        if (open.empty() || code > nodecode::largest) break;
        ++counts[open.back()];
        if ((code & nodecode::siblingFollows) == 0) open.pop_back();
        if ((code & nodecode::hasChildren) != 0) {
            open.push_back(counts.size());
            counts.push_back(0);
        }
    }
    return counts;
}

}  // namespace

TreeBuilder::TreeBuilder(BPathTree& target,
                         std::span<const std::uint8_t> nodeCodes)
    : tree(target), codes(nodeCodes), childCounts(countChildren(nodeCodes)) {
    tree.finder.clear();
    tree.root = BNodePtr::adopt(tree.pool.make({}, NodePool::Kind::folder));
    reserveChildren(*tree.root);
    open.push_back(tree.root.get());
}

void TreeBuilder::reserveChildren(BNode& folder) {
    NodePool::reserve(folder, childCounts[nextCount++]);
}

void TreeBuilder::add(ComponentView value) {
    if (nextCode == codes.size()) throw DamagedFormException();
    const std::uint8_t code = codes[nextCode++];
    const bool known = code <= nodecode::largest;
    const bool isFolder = known && (code & nodecode::hasChildren) != 0;
    BNode& node =
        tree.pool.add(*open.back(), value,
                      isFolder ? NodePool::Kind::folder : NodePool::Kind::leaf);
    if (!known) throw UnknownNodeTypeException();
    if ((code & nodecode::siblingFollows) == 0) open.pop_back();
    if (isFolder) {
        reserveChildren(node);
        open.push_back(&node);
    } else {
        ++leafCount;
    }
}

}  // namespace tessel
