#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "pathtree/BPathTree.hpp"
#include "pathtree/NodeWalk.hpp"

namespace tessel {

// Node codes of the stored path tree. Stored as bytes; never change them.
namespace nodecode {
constexpr std::uint8_t hasChildren = 1;     // bit 0
constexpr std::uint8_t siblingFollows = 2;  // bit 1
constexpr std::uint8_t largest = hasChildren | siblingFollows;

// The code of the node that the walk stands on.
inline std::uint8_t of(const NodeWalk& walk) noexcept {
    return static_cast<std::uint8_t>(
        (walk.isLeaf() ? 0U : hasChildren) |
        (walk.isLastChild() ? 0U : siblingFollows));
}
}  // namespace nodecode

// Rebuilds a path tree from node codes and values in pre-order. Construction
// gives the tree a new root; then, as long as the tree is not complete(),
// add() attaches the next node.
//
// Ownership: borrows the tree and the codes.
// Cost: linear; child lists are made at their final size. Beside the tree it
//   takes 4 bytes a folder and the open folders.
class TreeBuilder {
public:
    // Codes may be hostile; they are judged as add() comes to them.
    TreeBuilder(BPathTree& target, std::span<const std::uint8_t> nodeCodes);

    bool complete() const noexcept { return open_.empty(); }

    // Attaches a node with a copy of the value. Throws DamagedFormException
    // when no code is left and UnknownNodeTypeException on an unknown code;
    // then the node is attached as a leaf.
    void add(ComponentView value);

    std::size_t leaves() const noexcept { return leafCount_; }

private:
    void reserveChildren(BNode& folder);

    BPathTree& tree_;
    std::span<const std::uint8_t> codes_;
    std::vector<std::uint32_t> childCounts_;  // of the root and each folder
    std::size_t nextCount_ = 0;
    std::size_t nextCode_ = 0;
    std::size_t leafCount_ = 0;
    std::vector<BNode*> open_;  // folders that still await a child
};

}  // namespace tessel
