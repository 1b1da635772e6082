#pragma once

#include <cstdint>

namespace tessel {

// A node of the Huffman tree. All nodes are in one vector; a node names
// another by its position there.
struct HNode {
    double frequency = 0;     // a leaf's own; an inner node's children's sum
    char16_t character = 0;   // a leaf's code unit; 0 in an inner node
    std::int32_t index = -1;  // the node's own position; -1: not stored yet
    std::int32_t left = -1;   // the child reached by bit 0; -1: none
    std::int32_t right = -1;  // the child reached by bit 1; -1: none

    bool isLeaf() const noexcept { return left == -1 && right == -1; }
};

// Orders a standard (max-)heap so that the smallest frequency is on top.
// There is no second key: equal frequencies come out in the order in which
// the heap's own steps leave them, and encoded bytes depend on that order.
struct HNodeFrequencyComparator {
    bool operator()(const HNode& a, const HNode& b) const noexcept {
        return a.frequency > b.frequency;
    }
};

}  // namespace tessel
