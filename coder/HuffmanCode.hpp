#pragma once

#include <cstddef>
#include <cstdint>
#include <queue>
#include <string>
#include <vector>

#include "coder/CodeTable.hpp"
#include "coder/DecodeTable.hpp"
#include "coder/HNode.hpp"

namespace tessel {

// A Huffman code over UTF-16 code units: its tree, the tables for encoding
// and decoding that follow from it, and its compact form (the tree's shape
// and its leaves' characters).
//
// Invariants, once the code is there: nodes[rootIndex] is the root, each
//   node's index is its position, and `codes` has every leaf's character.
// Ownership: a value; copies are independent.
// Threads: any number of readers while nobody changes it.
// Cost: about 57 bytes per character and 30 KiB of tables.
class HuffmanCode {
public:
    using HeapQueue = std::priority_queue<HNode, std::vector<HNode>,
                                          HNodeFrequencyComparator>;

    // ---- Construction ----
    // What each step means is said at HuffmanPathTree's operation of the same
    // name.

    // Builds tree, compact form and tables. All or nothing; throws
    // std::logic_error if there is a code or a shape.
    void build(const double* characterFrequencies,
               const std::u16string& characters);
    void makeHeapAndTree(const double* characterFrequencies,
                         const std::u16string& characters);
    void generateTree(HeapQueue& queue);
    void generateCompressedTree();
    // Fills the tables from the tree.
    void generateCode();
    void addCode(const HNode& leaf);

    // ---- From the compact form ----

    // Builds tree and tables from boolTree and the characters of its leaves.
    // All or nothing; throws std::logic_error if there is a code and
    // DamagedFormException if the shape has not as many leaves.
    void restore(const std::u16string& characters);
    std::size_t inflateFromBoolTree();
    void inflateFromCompressedTree();
    void inflate();

    // ---- Questions ----

    // Calls visit with a copy of every node, in pre-order, left before right;
    // visit may change the tree. Without a tree it does nothing. Throws
    // std::logic_error before the first visit if a node links to none, or two
    // to one, as nodes that were edited may.
    template <class Visit>
    void traverse(Visit visit) const {
        for (HNode& node : inPreOrder()) visit(node);
    }

    // The code of a character, nearest the root first. Throws
    // CodeNotFoundException if it has none, and std::logic_error if a long one
    // leads through parentOf to no root.
    std::vector<bool> codeOf(char16_t character) const;

    const DecodeTable& decodeTable() const noexcept { return decodeTable_; }

    // True for the pre-order shape of exactly one binary tree whose inner
    // nodes all have two children, and for no shape at all.
    static bool isShape(const std::vector<bool>& bits);

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

    std::vector<bool> boolTree;       // shape in pre-order; true: a leaf
    std::u16string treeString;        // the leaves' characters in pre-order
    std::vector<double> frequencies;  // of the leaves, in pre-order
    std::int32_t rootIndex = 0;       // -1: no tree
    std::vector<HNode> nodes;
    CodeTable codes;
    std::vector<std::int32_t> parentOf;  // by position in nodes; -1: none

private:
    void requireNoCode() const;
    std::vector<HNode> inPreOrder() const;
    std::int32_t parentOfNode(std::int32_t child) const noexcept;
    template <class Build>
    void buildOrClear(Build build);
    bool isPosition(std::int32_t position) const noexcept {
        return position >= 0 &&
               static_cast<std::size_t>(position) < nodes.size();
    }

    DecodeTable decodeTable_;  // empty: decode by walking the tree
};

}  // namespace tessel
