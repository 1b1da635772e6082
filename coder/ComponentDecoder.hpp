#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "coder/HuffmanCode.hpp"
#include "pathtree/BNode.hpp"

namespace tessel {

// Decodes components: by the table as far as it leads, and by walking the
// tree for what the table does not hold.
//
// Ownership: borrows the code, which must outlive it and not change.
// Threads: any number of them.
class ComponentDecoder {
public:
    explicit ComponentDecoder(const HuffmanCode& code) noexcept : code_(code) {}

    // Appends the text of an encoded component. Input may be hostile: throws
    // DamagedFormException, with the text unchanged, if it is empty, its last
    // byte is above 7, or its bits lead off the tree. Bits after the last
    // whole code are ignored. A tree that is a single leaf gives one
    // character per bit.
    void appendText(ComponentView bytes, std::u16string& text) const;

    // If the node at `position` is a leaf, appends its character, moves
    // position to the root and returns true. Throws DamagedFormException if
    // there is no such node.
    bool appendIfLeaf(std::int32_t& position, std::u16string& text) const;

private:
    std::size_t decodeByTable(ComponentView bytes, std::size_t bit,
                              std::size_t end, std::u16string& text) const;
    std::size_t walkToLeaf(ComponentView bytes, std::size_t bit,
                           std::size_t end, std::u16string& text) const;

    const HuffmanCode& code_;
};

}  // namespace tessel
