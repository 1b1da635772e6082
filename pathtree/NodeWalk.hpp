#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// One pass over all nodes below a root, depth first, parents before their
// children and siblings in order, without recursion:
//
//   for (NodeWalk walk(root); walk.next();) use(walk.node().value());
//
// Ownership: borrows the tree, which must not change during the walk.
class NodeWalk {
public:
    explicit NodeWalk(BNode root) { open_.push_back(root.children().reader()); }

    // Moves to the next node; false when there is none.
    bool next() {
        if (current_.folder != nullptr)
            open_.emplace_back(current_.folder->children());
        while (!open_.empty()) {
            ChildReader& siblings = open_.back();
            if (!siblings.atEnd()) {
                current_ = siblings.next();
                return true;
            }
            open_.pop_back();
        }
        current_ = {};
        return false;
    }

    // The node that next() moved to.
    const Child& node() const noexcept { return current_; }
    bool isLeaf() const noexcept { return childCount() == 0; }
    std::size_t childCount() const noexcept {
        return current_.folder == nullptr
                   ? 0
                   : static_cast<std::size_t>(
                         current_.folder->children().count());
    }
    // The folders that it is in, the root not counted.
    std::size_t depth() const noexcept { return open_.size() - 1; }
    // True when it is its parent's last child.
    bool isLastChild() const noexcept { return open_.back().atEnd(); }

private:
    std::vector<ChildReader> open_;
    Child current_;
};

}  // namespace tessel
