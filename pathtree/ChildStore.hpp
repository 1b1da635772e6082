#pragma once

#include <cstddef>
#include <cstdint>

namespace tessel {

class BNode;

// The array of a node with several children: one allocation, owned by the
// node. Each used slot owns a share of a child.
//
//   | size, 4 | capacity, 4 | slot 0, 8 | slot 1, 8 | ...
struct ChildBlock {
    std::uint32_t size;
    std::uint32_t capacity;

    BNode** slots() noexcept { return reinterpret_cast<BNode**>(this + 1); }
};

// The children of one node in one word, a tagged pointer:
//
//   no child         0
//   an only child    address of the child | 1     most folders of a deep list
//   several          address of a ChildBlock      have one child: no array
//
// Nodes and blocks are aligned to four bytes, so the lowest bit is free for
// the tag. While a dead node waits for its child to be released, the place
// of that child holds the node's parent instead (see BNode.cpp).
//
// Where the word is kept depends on what the node was made as: see BNode.
class ChildStore {
public:
    ChildStore() noexcept = default;
    static ChildStore only(BNode* child) noexcept {
        return ChildStore(reinterpret_cast<std::uintptr_t>(child) | onlyFlag);
    }
    static ChildStore array(ChildBlock* block) noexcept {
        return ChildStore(reinterpret_cast<std::uintptr_t>(block));
    }

    bool isOnly() const noexcept { return (word_ & onlyFlag) != 0; }
    BNode* child() const noexcept {
        return reinterpret_cast<BNode*>(word_ & ~onlyFlag);
    }
    // Null if there is none.
    ChildBlock* block() const noexcept {
        return isOnly() ? nullptr : reinterpret_cast<ChildBlock*>(word_);
    }
    std::size_t size() const noexcept {
        if (isOnly()) return 1;
        return word_ == 0 ? 0 : block()->size;
    }

private:
    static constexpr std::uintptr_t onlyFlag = 1;

    explicit ChildStore(std::uintptr_t word) noexcept : word_(word) {}

    std::uintptr_t word_ = 0;
};

}  // namespace tessel
