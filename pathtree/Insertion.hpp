#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/ChildIndex.hpp"
#include "pathtree/NodePool.hpp"

namespace tessel {

// One insertion on its way down from the root of a path tree. Unless it is
// committed, its end takes away the nodes that it made, and what the caller
// appended to the track: a path or a folder is added whole or not at all.
//
// Ownership: borrows all that it is given.
class Insertion {
public:
    Insertion(BNode& root, NodePool& pool, ChildIndex& index,
              std::vector<std::uint64_t>& track) noexcept
        : pool_(pool),
          index_(index),
          track_(track),
          trackLength_(track.size()),
          node_(&root) {}
    Insertion(const Insertion&) = delete;
    Insertion& operator=(const Insertion&) = delete;
    ~Insertion() {
        if (!committed_) takeBack();
    }

    // Goes to the child of this value; makes it if there is none. Returns
    // its position. Throws std::bad_alloc or std::length_error.
    std::uint64_t enter(ComponentView value, NodePool::Kind kind) {
        const ChildIndex::Found found = index_.find(*node_, value);
        existed_ = found.child != nullptr;
        if (!existed_) return make(value, kind);
        node_ = found.child;
        return found.position;
    }

    BNode& node() const noexcept { return *node_; }
    // Whether the last component that was entered was there.
    bool existed() const noexcept { return existed_; }
    void commit() noexcept { committed_ = true; }

private:
    std::uint64_t make(ComponentView value, NodePool::Kind kind);
    void takeBack() noexcept;

    NodePool& pool_;
    ChildIndex& index_;
    std::vector<std::uint64_t>& track_;
    std::size_t trackLength_;
    BNode* node_;
    bool existed_ = false;
    bool committed_ = false;
    BNode* firstChanged_ = nullptr;  // the parent of the first new node
    std::size_t childrenBefore_ = 0;
};

}  // namespace tessel
