#pragma once

#include <cstddef>

#include "pathtree/FolderNode.hpp"

namespace tessel {

class NodeSlab;

// Makes the nodes of folders, one after the other in slabs, so that a node
// costs its own bytes and no allocator's header.
//
//   a node takes | beside its name and its children
//   -------------+-------------------------------------------------------
//   9 to 12      | up to 62 bytes of name
//   17 to 20     | 63 to 1,024 bytes
//   25 to 28     | more; the name has a heap block of its own (8 to 23
//                | bytes more)
//   8 more       | if the block of children is not small: it is on the heap
//
// Ownership: a slab lives as long as any of its nodes, or as long as the
//   pool still fills it; nodes may outlive the pool.
// Threads: one pool is used from one thread at a time. Nodes of one slab may
//   be released on several threads.
// Cost: a pool leaves at most one slab partly filled; slabs grow with what
//   the pool has made, from 1 to 16 KiB.
class NodePool {
public:
    NodePool() noexcept = default;
    NodePool(const NodePool&) = delete;
    NodePool& operator=(const NodePool&) = delete;
    ~NodePool();

    // A new node that holds a copy of the name and these children; the caller
    // owns its one share. Throws std::bad_alloc; the children's shares then
    // stay the caller's.
    FolderNode* make(ComponentView name, const ChildBatch& children);

private:
    void* allocate(std::size_t bytes);

    NodeSlab* current_ = nullptr;
    std::size_t allocated_ = 0;  // bytes taken by nodes so far
};

}  // namespace tessel
