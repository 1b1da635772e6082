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
// add() takes the next node. A folder's node is made when its last child is
// there; until then its children wait on a stack. What waits when the builder
// ends is attached then, as far as memory allows.
//
// Ownership: borrows the tree and the codes.
// Cost: linear; a folder's children are copied once, into a block of their
//   size. Beside the tree it takes the entries of the open folders and 16
//   bytes for each of these.
//
// What a hostile form can demand: a node takes two bytes of the payload at
// least (its code and its length), and most for its size if its name is
// empty. A comb of such nodes, each folder with a file and one more folder,
// makes 11 bytes of heap per byte of payload, tree and builder together, and
// at most 18 with the room that the builder's vectors hold in reserve. A
// compressed form is at most 1,032 times smaller than its payload, so the two
// multiply: bound the input to bound the memory.
class TreeBuilder {
public:
    // Codes may be hostile; they are judged as add() comes to them.
    TreeBuilder(BPathTree& target, std::span<const std::uint8_t> nodeCodes);
    TreeBuilder(const TreeBuilder&) = delete;
    TreeBuilder& operator=(const TreeBuilder&) = delete;
    ~TreeBuilder();

    bool complete() const noexcept { return open_.empty(); }

    // Takes a node with a copy of the value. Throws DamagedFormException
    // when no code is left and UnknownNodeTypeException on an unknown code;
    // then the node is taken as a leaf.
    void add(ComponentView value);

    std::size_t leaves() const noexcept { return leafCount_; }

private:
    // A folder that still awaits a child.
    struct OpenFolder {
        std::size_t nameAt = 0;  // its own entry on the stack, as a file's
        std::uint32_t count = 0;
        bool hasFolders = false;
        bool hasFiles = false;
        bool hasLastChild = false;
    };

    void push(ComponentView value);
    void close();
    void replaceByNode(std::size_t nameAt, const ChildBatch& children);
    void releaseWaiting() noexcept;

    TreeInserter& inserter_;
    BNode root_;
    std::span<const std::uint8_t> codes_;
    std::size_t nextCode_ = 0;
    std::size_t leafCount_ = 0;
    std::vector<std::uint8_t> entries_;  // of the open folders, root first
    std::vector<OpenFolder> open_;
};

}  // namespace tessel
