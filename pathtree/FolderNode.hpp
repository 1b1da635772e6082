#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <utility>

#include "pathtree/ChildBlock.hpp"

namespace tessel {

// The root, or a component that has children.
// Its name, its share count and the way to its children are in one piece of a
// NodeSlab. Files have no node: they are entries of their folder's ChildBlock.
//
//   | shares, 4 | parent, 4 | length 6 | flags 2 bits | name | children |
//   |           |           | one byte                |      |          |
//
//   length bits | after the byte
//   ------------+-------------------------------------------------------------
//   0 to 62     | the name, which has that many bytes
//   63          | the name's length, 8 bytes; then the name or, if it is longer
//               | than maxInSlab, the address of a heap block with it, 8 bytes
//
//   flag         | after the name
//   -------------+------------------------------------------------------------
//   inlineBlock  | a ChildBlock. A new node has its children here if they take
//                | at most maxInlineBlock bytes
//   none         | the address of a ChildBlock on the heap, 8 bytes; null in a
//                | root without paths
//
// The parent is said as a distance: 0 for the root, and where it would be more
// than 8 GiB.
//
// Invariants: the name never changes; children are only appended, or a file
//   among them becomes a folder; every folder among them is kept alive, and
//   is in one folder only.
// Ownership: handles (BNodePtr) and the parent's block own shares of a node.
// Threads: the count is atomic, all else must not be read while it changes.
class FolderNode {
public:
    // Longer names have a heap block of their own, so that slabs stay well
    // filled: a node takes at most about 1.2 KiB, and no more than that is lost
    // at the end of a slab of 16 KiB.
    static constexpr std::size_t maxInSlab = 1024;
    // A block that grows leaves its place in the slab unused. So only those
    // stay there that are small.
    static constexpr std::size_t maxInlineBlock = 192;

    FolderNode(const FolderNode&) = delete;
    FolderNode& operator=(const FolderNode&) = delete;

    // The component's encoded bytes, valid as long as the node.
    ComponentView value() const noexcept {
        const unsigned shortLength = lengthAndFlags_ >> lengthShift;
        if (shortLength != longLength) return {afterFlags(), shortLength};
        return longValue();
    }

    // Valid until children are appended or promoted.
    ChildBlock children() const noexcept {
        std::uint8_t* const place = childPlace();
        if ((lengthAndFlags_ & inlineBlock) != 0) return ChildBlock(place);
        std::uint8_t* block = nullptr;
        std::memcpy(&block, place, sizeof block);
        return ChildBlock(block);
    }
    // The child at a position, which must be below children().count().
    Child child(std::uint64_t position) const noexcept {
        const ChildBlock block = children();
        return ChildBlock::read(block.entries() + block.offsetOf(position));
    }

    // The folder that this one is in, if that is known. It may be gone, unless
    // somebody keeps the root alive.
    const FolderNode* parent() const noexcept {
        return parent_ == 0 ? nullptr : atSteps(parent_);
    }

    FolderNode* parent() noexcept {
        return const_cast<FolderNode*>(std::as_const(*this).parent());
    }

    // How far this node is behind another one in memory, and the node that is
    // so far behind this one.
    std::int64_t stepsFrom(const FolderNode& other) const noexcept {
        return (address() - other.address()) / step();
    }
    const FolderNode* atSteps(std::int64_t steps) const noexcept {
        return reinterpret_cast<const FolderNode*>(
            reinterpret_cast<const char*>(this) + steps * step());
    }

    // Prefetches the children.
    void prefetchChildren() const noexcept {
        __builtin_prefetch(children().memory());
    }

    // Appends children. Throws std::bad_alloc, or std::length_error beyond
    // 2^32 - 1 children, with nothing changed.
    void append(const ChildBatch& batch);

    // Makes sure that promote does not throw. Throws std::bad_alloc.
    void reservePromotion(std::uint64_t position);
    // Makes the file at this position a folder; takes over a share of it.
    // What it changes is in the block, but belongs to the node.
    // NOLINTNEXTLINE(readability-make-member-function-const)
    void promote(std::uint64_t position, FolderNode* folder) noexcept {
        children().promote(position, folder);
        folder->setParent(*this);
    }

    // Gives back what growth of the children has left unused.
    void trim() noexcept;

    // Heap bytes that the node alone owns outside its slab, as the allocator
    // counts them: the block of children and a name above maxInSlab.
    std::size_t ownChildBytes() const noexcept;
    std::size_t ownValueBytes() const noexcept;

    // Relaxed: whoever takes a new share has one already, through which the
    // node reached this thread.
    void share() noexcept { shares_.fetch_add(1, std::memory_order_relaxed); }
    // Gives one share back. The last one releases the node and all that it
    // alone owns, without recursion and without taking memory.
    void release() noexcept {
        if (unshare()) destroy(this);
    }

private:
    friend class NodePool;

    static constexpr std::uint8_t inlineBlock = 1;
    static constexpr unsigned lengthShift = 2;
    static constexpr unsigned longLength = 63;

    FolderNode() noexcept = default;

    // Nodes are as far apart as some of these.
    static constexpr std::int64_t step() noexcept {
        return alignof(FolderNode);
    }
    std::int64_t address() const noexcept {
        return static_cast<std::int64_t>(reinterpret_cast<std::intptr_t>(this));
    }
    void setParent(const FolderNode& parent) noexcept;
    // Becomes the parent of the folders among new children.
    void adopt(const ChildBatch& batch) const noexcept;

    std::uint8_t* afterFlags() const noexcept {
        return const_cast<std::uint8_t*>(&lengthAndFlags_) + 1;
    }
    std::uint8_t* childPlace() const noexcept {
        const unsigned shortLength = lengthAndFlags_ >> lengthShift;
        if (shortLength != longLength) return afterFlags() + shortLength;
        return afterLongValue();
    }
    std::uint64_t storedLength() const noexcept;
    ComponentView longValue() const noexcept;
    std::uint8_t* afterLongValue() const noexcept;
    // The heap blocks of the name and of the children, or null.
    std::uint8_t* ownValue() const noexcept;
    std::uint8_t* ownBlock() const noexcept;
    void setBlock(std::uint8_t* block) noexcept;

    // True when the share was the last. Release: what this thread did to the
    // node comes before its destruction. Acquire: so does what others did.
    bool unshare() noexcept {
        return shares_.fetch_sub(1, std::memory_order_acq_rel) == 1;
    }
    static void destroy(FolderNode* dead) noexcept;
    void releaseOwned() noexcept;

    std::atomic<std::uint32_t> shares_ = 1;
    std::int32_t parent_ = 0;  // steps from here
    std::uint8_t lengthAndFlags_ = 0;
};

static_assert(alignof(FolderNode) == 4);

inline ComponentView Child::value() const noexcept {
    return folder != nullptr ? folder->value() : name;
}

}  // namespace tessel
