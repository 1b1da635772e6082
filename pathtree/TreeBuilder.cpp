#include "pathtree/TreeBuilder.hpp"

#include "packing/ByteCursor.hpp"
#include "pathtree/NodeCode.hpp"

namespace tessel {

namespace {

// The number of children of the root and of each folder, in pre-order, as
// far as the codes go.
std::vector<std::uint32_t> countChildren(std::span<const std::uint8_t> codes) {
    std::vector<std::uint32_t> counts{0};
    std::vector<std::size_t> open{0};
    for (const std::uint8_t code : codes) {
        if (open.empty() || code > nodecode::maxCode) break;
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
    : inserter_(target.inserter()),
      codes_(nodeCodes),
      childCounts_(countChildren(nodeCodes)) {
    target.root = inserter_.makeRoot();
    reserveChildren(*target.root);
    open_.push_back(target.root.get());
}

void TreeBuilder::reserveChildren(BNode& folder) {
    NodePool::reserve(folder, childCounts_[nextCount_++]);
}

void TreeBuilder::add(ComponentView value) {
    if (nextCode_ == codes_.size()) throw DamagedFormException();
    const std::uint8_t code = codes_[nextCode_++];
    const bool known = code <= nodecode::maxCode;
    const bool isFolder = known && (code & nodecode::hasChildren) != 0;
    BNode& node =
        inserter_.add(*open_.back(), value,
                      isFolder ? NodePool::Kind::folder : NodePool::Kind::leaf);
    if (!known) throw UnknownNodeTypeException();
    if ((code & nodecode::siblingFollows) == 0) open_.pop_back();
    if (isFolder) {
        reserveChildren(node);
        open_.push_back(&node);
    } else {
        ++leafCount_;
    }
}

}  // namespace tessel
