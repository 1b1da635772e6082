#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// One pass over all nodes below a root, depth first, parents before their
// children and siblings in order, without recursion:
//
//   for (NodeWalk walk(root); walk.next();) use(walk.node());
//
// Ownership: borrows the tree, which must not change during the walk.
class NodeWalk {
public:
    explicit NodeWalk(const BNode& root) { open_.push_back({&root, 0}); }

    // Moves to the next node; false when there is none.
    bool next() {
        if (current_ != nullptr && hasChildren_) open_.push_back({current_, 0});
        while (!open_.empty()) {
            Folder& folder = open_.back();
            const ChildList children = folder.node->children();
            if (folder.next < children.size()) {
                current_ = &children[folder.next++];
                last_ = folder.next == children.size();
                hasChildren_ = !current_->isLeaf();
                return true;
            }
            open_.pop_back();
        }
        return false;
    }

    // The node that next() moved to.
    const BNode& node() const noexcept { return *current_; }
    bool isLeaf() const noexcept { return !hasChildren_; }
    // The folders that it is in, the root not counted.
    std::size_t depth() const noexcept { return open_.size() - 1; }
    // True when it is its parent's last child.
    bool isLastChild() const noexcept { return last_; }

private:
    struct Folder {
        const BNode* node;
        std::size_t next;  // position of the child to visit next
    };

    std::vector<Folder> open_;
    const BNode* current_ = nullptr;
    bool hasChildren_ = false;
    bool last_ = false;
};

}  // namespace tessel
