#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "pathtree/ChildStore.hpp"
#include "pathtree/Component.hpp"

namespace tessel {

class BNode;

// The children of one node in the order of insertion: a view, valid as long
// as the node. Children are only ever appended.
class ChildList {
public:
    explicit ChildList(BNode& node) noexcept : owner_(&node) {}

    std::size_t size() const noexcept;
    bool empty() const noexcept { return size() == 0; }
    // The child at position i, which must be below size().
    BNode& operator[](std::size_t i) const noexcept;
    BNode& back() const noexcept { return (*this)[size() - 1]; }
    BNode& node() const noexcept { return *owner_; }

private:
    BNode* owner_;
};

// One component of the trie: its value, its children and its share count,
// in one piece of a NodeSlab.
//
//    prefix slot             | the node's address, a multiple of 4
//   |------------------------|-------------|-----------------|----------- - -
//   | children, 8            | count, 4    | length 6 | flags 2 bits | value
//   | only if made a folder  | of shares   | one byte               |
//
//   length bits | length of the value | the value begins after the byte with
//   ------------+---------------------+-------------------------------------
//   0 to 62     | the same            | the value's bytes
//   63          | 63 to maxInSlab     | length, 8 bytes; the value's bytes
//   63          | above maxInSlab     | length, 8 bytes; the address of the
//               |                     | value, 8 bytes: a heap block
//
//   flags            | the children's word (ChildStore) is
//   -----------------+-----------------------------------------------------
//   0                | nowhere: made as a leaf, and without children so far
//   hasPrefixSlot    | before the node: made as a folder
//   hasSlabStore     | in a table of the slab: made as a leaf, but got
//                    | children after all; the node stays where it is
//
// Most nodes are files and never have children, hence the second row's slot
// only for folders.
//
// Invariants: the value never changes; children are only appended; every
//   child in the list is kept alive by it.
// Ownership: handles (BNodePtr) and the parent's list own shares of a node.
// Threads: the count is atomic, all else must not be read while it changes.
class BNode {
public:
    // Longer values have a block of their own, so that slabs stay well
    // filled: at most this part of 16 KiB is lost at the end of each.
    static constexpr std::size_t maxInSlab = 1024;

    BNode(const BNode&) = delete;
    BNode& operator=(const BNode&) = delete;

    // The component's encoded bytes, valid as long as the node.
    ComponentView value() const noexcept {
        const std::uint8_t* at = afterFlags();
        const unsigned shortLength = lengthAndFlags_ >> lengthShift;
        if (shortLength != longLength) return {at, shortLength};
        return longValue();
    }

    ChildList children() const noexcept {
        return ChildList(const_cast<BNode&>(*this));
    }
    bool isLeaf() const noexcept { return children().empty(); }

    // Heap bytes that the node alone owns outside its slab, as the allocator
    // counts them: the array of children and a value above maxInSlab.
    std::size_t childListBytes() const noexcept;
    std::size_t ownValueBytes() const noexcept;

private:
    friend class BNodePtr;
    friend class ChildList;
    friend class NodePool;

    static constexpr std::uint8_t hasPrefixSlot = 1;
    static constexpr std::uint8_t hasSlabStore = 2;
    static constexpr unsigned lengthShift = 2;
    static constexpr unsigned longLength = 63;

    BNode() noexcept = default;

    const std::uint8_t* afterFlags() const noexcept {
        return &lengthAndFlags_ + 1;
    }
    std::uint8_t* afterFlags() noexcept { return &lengthAndFlags_ + 1; }
    ComponentView longValue() const noexcept;
    // The heap block of the value, or nullptr.
    std::uint8_t* ownValue() const noexcept;

    void* prefixSlot() const noexcept {
        return const_cast<char*>(reinterpret_cast<const char*>(this)) -
               sizeof(ChildStore);
    }
    ChildStore store() const noexcept {
        ChildStore kept;
        if ((lengthAndFlags_ & hasPrefixSlot) != 0)
            std::memcpy(&kept, prefixSlot(), sizeof kept);
        else if ((lengthAndFlags_ & hasSlabStore) != 0)
            kept = slabStore();
        return kept;
    }
    ChildStore slabStore() const noexcept;
    // Throws std::bad_alloc, with nothing changed, when a node that was made
    // as a leaf gets its first store.
    void setStore(ChildStore kept) {
        if ((lengthAndFlags_ & hasPrefixSlot) != 0)
            std::memcpy(prefixSlot(), &kept, sizeof kept);
        else
            setSlabStore(kept);
    }
    void setSlabStore(ChildStore kept);

    // Relaxed: whoever takes a new share has one already, through which the
    // node reached this thread.
    void share() noexcept { shares_.fetch_add(1, std::memory_order_relaxed); }
    // Gives one share back; true when it was the last. Release: what this
    // thread did to the node comes before its destruction. Acquire: so does
    // what the others did.
    bool unshare() noexcept {
        return shares_.fetch_sub(1, std::memory_order_acq_rel) == 1;
    }

    // Releases a node whose last share is gone, and all that it alone owns,
    // without recursion and without taking memory.
    static void destroy(BNode* dead) noexcept;
    BNode* popChild() noexcept;
    void stashParent(BNode* parent) noexcept;
    BNode* unstashParent() noexcept;
    void releaseOwned() noexcept;

    std::atomic<std::uint32_t> shares_ = 1;
    std::uint8_t lengthAndFlags_ = 0;
};

static_assert(alignof(BNode) >= 4 && alignof(ChildBlock) >= 4);

inline std::size_t ChildList::size() const noexcept {
    return owner_->store().size();
}
inline BNode& ChildList::operator[](std::size_t i) const noexcept {
    const ChildStore kept = owner_->store();
    return kept.isOnly() ? *kept.child() : *kept.block()->slots()[i];
}

}  // namespace tessel
