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
    explicit NodeWalk(const BNode& root) { open.push_back({&root, 0}); }

    // Moves to the next node; false when there is none.
    bool next() {
        if (current != nullptr && hasChildren) open.push_back({current, 0});
        while (!open.empty()) {
            Folder& folder = open.back();
            const ChildList children = folder.node->children();
            if (folder.next < children.size()) {
                current = &children[folder.next++];
                last = folder.next == children.size();
                hasChildren = !current->isLeaf();
                return true;
            }
            open.pop_back();
        }
        return false;
    }

    // The node that next() moved to.
    const BNode& node() const noexcept { return *current; }
    bool isLeaf() const noexcept { return !hasChildren; }
    // True when it is its parent's last child.
    bool isLastChild() const noexcept { return last; }

private:
    struct Folder {
        const BNode* node;
        std::size_t next;  // position of the child to visit next
    };

    std::vector<Folder> open;
    const BNode* current = nullptr;
    bool hasChildren = false;
    bool last = false;
};

}  // namespace tessel
