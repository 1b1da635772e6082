#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

#include "pathtree/FolderNode.hpp"

namespace tessel {

// An aligned chunk of an arena: nodes are allocated in it front to back and
// never move. It frees itself when its last node is released.
//
//   | NodeSlab | node | node | ... | not used |
//   ^ a multiple of 16 KiB
//
// A node finds its slab by clearing the low bits of its address.
//
// Ownership: each node holds the slab, and so does the pool that fills it.
// Threads: one pool fills a slab. All else may be called for different nodes
//   on different threads: trees that share no node may share a slab.
class NodeSlab {
public:
    static constexpr std::size_t alignment = std::size_t{16} << 10;
    // Leaves room for the allocator's own header, so that slabs which follow
    // each other in memory waste no space between them.
    static constexpr std::size_t maxBytes = alignment - 64;
    static constexpr std::size_t minBytes = 1024 - 64;
    static constexpr std::size_t nodeAlignment = alignof(FolderNode);

    // A slab of this many bytes, held once. Throws std::bad_alloc.
    static NodeSlab* create(std::size_t bytes);

    static NodeSlab* of(const FolderNode* node) noexcept {
        const auto address = reinterpret_cast<std::uintptr_t>(node);
        return reinterpret_cast<NodeSlab*>(address & ~(alignment - 1));
    }

    NodeSlab(const NodeSlab&) = delete;
    NodeSlab& operator=(const NodeSlab&) = delete;

    // The address of a new node of this many bytes; nullptr if no room is left.
    // The node holds the slab.
    void* allocate(std::size_t bytes) noexcept {
        constexpr std::size_t unit = nodeAlignment;
        const std::size_t total = (bytes + unit - 1) / unit * unit;
        if (total > size_ - used_) return nullptr;
        char* at = reinterpret_cast<char*>(this) + used_;
        used_ += total;
        // Relaxed: the pool's own hold keeps the slab alive meanwhile.
        holds_.fetch_add(1, std::memory_order_relaxed);
        return at;
    }

    // Gives back one hold: a node's or the pool's. Release and acquire: what
    // any thread did to its nodes comes before the slab is freed.
    void release() noexcept {
        if (holds_.fetch_sub(1, std::memory_order_acq_rel) == 1) free();
    }

    // Heap bytes of the slab.
    std::size_t memoryBytes() noexcept;

private:
    explicit NodeSlab(std::size_t bytes) noexcept : size_(bytes) {}
    ~NodeSlab() = default;

    void free() noexcept;

    std::atomic<std::size_t> holds_{1};  // nodes, and 1 while a pool fills it
    std::size_t size_;
    std::size_t used_ = sizeof(NodeSlab);  // only the pool reads or changes it
};

}  // namespace tessel
