#pragma once

#include <cstddef>

#include "pathtree/BNodePtr.hpp"

namespace tessel {

class NodeSlab;

// Makes nodes, one after the other in slabs, so that a node costs its own
// bytes and no allocator's header, and appends them to their parents.
//
//   value, bytes    | a node takes, beside its value
//   ----------------+-----------------------------------------------------
//   up to 62        | 5 to 8 bytes
//   63 to 1,024     | 13 to 16 bytes
//   more            | 21 to 24 bytes, and the value has a heap block of its
//                   | own (8 to 23 bytes more)
//   any             | 8 bytes more if it is made as a folder
//
// Ownership: a slab lives as long as any of its nodes, or as long as the
//   pool still fills it; nodes may outlive the pool.
// Threads: one pool is used from one thread at a time. Nodes of one slab may
//   be released on several threads.
// Cost: a pool leaves at most one slab partly filled; slabs grow with what
//   the pool has made, from 1 to 16 KiB.
class NodePool {
public:
    // What a node is made for. A leaf can still get children later, at a
    // higher price: about 50 bytes, and a lock at each access to them.
    enum class Kind { leaf, folder };

    NodePool() noexcept = default;
    NodePool(const NodePool&) = delete;
    NodePool& operator=(const NodePool&) = delete;
    ~NodePool();

    // A new node without children that holds a copy of the value; the caller
    // owns its one share. Throws std::bad_alloc.
    BNode* make(ComponentView value, Kind kind);

    // Makes a node and appends it to the children of parent; returns it.
    // Throws as make and append do, with nothing changed.
    BNode& add(BNode& parent, ComponentView value, Kind kind);

    // Makes room for `count` more children at once, without slack if the
    // list is empty. Throws std::bad_alloc, or std::length_error beyond
    // 2^32 - 1 children, with nothing changed.
    static void reserve(BNode& parent, std::size_t count);

    // Releases the children of parent at position `size` and above.
    static void truncate(BNode& parent, std::size_t size) noexcept;

private:
    static void append(BNode& parent, BNodePtr& child);
    void* allocate(std::size_t before, std::size_t bytes);

    NodeSlab* current_ = nullptr;
    std::size_t allocated_ = 0;  // bytes taken by nodes so far
};

}  // namespace tessel
