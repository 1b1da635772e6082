#pragma once

#include <cstddef>
#include <cstdint>

#include "pathtree/BNode.hpp"

namespace tessel {

class NodeSlab;

// Makes nodes, one after the other in slabs, so that a node costs its own
// bytes and no allocator's header.
//
// Ownership: a slab lives as long as any of its nodes, or as long as the
//   pool still fills it; nodes may outlive the pool.
// Threads: one pool is used from one thread at a time. Nodes of one slab may
//   be released on several threads.
// Cost: a node takes its value, 5 to 7 bytes, and 8 more if it is made to
//   have children. A pool leaves at most one slab partly filled; slabs grow
//   with what the pool has made, from 1 to 16 KiB.
class NodePool {
public:
    // What a node is made for. A leaf can still get children later, at a
    // higher price.
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

    // Appends child to the children of parent, whose list takes over the
    // handle's share; the handle is left empty. Throws std::bad_alloc, or
    // std::length_error at 2^32 - 1 children, with nothing changed.
    static void append(BNode& parent, BNodePtr& child);

    // Makes room for `count` more children at once, without slack if the
    // list is empty. Throws as append does.
    static void reserve(BNode& parent, std::size_t count);

    // Releases the children of parent at position `size` and above.
    static void truncate(BNode& parent, std::size_t size) noexcept;

private:
    void* allocate(std::size_t before, std::size_t bytes);

    NodeSlab* current_ = nullptr;
    std::size_t made_ = 0;  // bytes taken by nodes so far
};

}  // namespace tessel
