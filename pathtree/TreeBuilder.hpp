#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "pathtree/BPathTree.hpp"
#include "pathtree/TreeInserter.hpp"

namespace tessel {

// Rebuilds a path tree from node codes and values in pre-order. Construction
// gives the tree a new root; then, as long as the tree is not complete(),
// add() attaches the next node.
//
// Ownership: borrows the tree and the codes.
// Cost: linear; child lists are made at their final size. Beside the tree it
//   takes 4 bytes per folder and 8 per open folder.
//
// What a hostile form can demand: a node takes two bytes of the payload at
// least (its code and its length), and most for its size if its name is
// empty. A comb of such nodes, each folder with a file and one more folder,
// makes 18 bytes of heap per byte of payload, tree and builder together. A
// compressed form is at most 1,032 times smaller than its payload, so the
// two multiply: bound the input to bound the memory.
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

    TreeInserter& inserter_;
    std::span<const std::uint8_t> codes_;
    std::vector<std::uint32_t> childCounts_;  // of the root and each folder
    std::size_t nextCount_ = 0;
    std::size_t nextCode_ = 0;
    std::size_t leafCount_ = 0;
    std::vector<BNode*> open_;  // folders that still await a child
};

}  // namespace tessel
