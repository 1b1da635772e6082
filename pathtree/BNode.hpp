#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <span>
#include <utility>

namespace tessel {

class BNode;
class NodePool;

// The bytes of one encoded component, borrowed.
using ComponentView = std::span<const std::uint8_t>;

// Equal length and equal bytes.
inline bool sameComponent(ComponentView a, ComponentView b) noexcept {
    return a.size() == b.size() &&
           (a.empty() || std::memcmp(a.data(), b.data(), a.size()) == 0);
}

// Shared ownership of one node: 8 bytes, the count stands in the node.
//
// Threads: counts are atomic, so handles to one node may be copied and
// released on different threads. Releasing the last handle releases what the
// node owns, without recursion and without allocating memory.
class BNodePtr {
public:
    BNodePtr() noexcept = default;
    explicit BNodePtr(BNode* target) noexcept;  // takes a new share
    BNodePtr(const BNodePtr& other) noexcept;
    BNodePtr(BNodePtr&& other) noexcept
        : node_(std::exchange(other.node_, nullptr)) {}
    BNodePtr& operator=(BNodePtr other) noexcept {
        std::swap(node_, other.node_);
        return *this;
    }
    ~BNodePtr();

    // The handle that takes over a share which the caller owns.
    static BNodePtr adopt(BNode* owned) noexcept;
    // Hands the share over to the caller and leaves the handle empty.
    BNode* release() noexcept { return std::exchange(node_, nullptr); }

    BNode* get() const noexcept { return node_; }
    BNode& operator*() const noexcept { return *node_; }
    BNode* operator->() const noexcept { return node_; }
    explicit operator bool() const noexcept { return node_ != nullptr; }
    friend bool operator==(const BNodePtr& a, const BNodePtr& b) noexcept {
        return a.node_ == b.node_;
    }

private:
    BNode* node_ = nullptr;
};

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

// The array that several children of a node stand in: one allocation, owned by
// the node, of which each used slot owns a share of a child.
struct ChildBlock {
    std::uint32_t size;
    std::uint32_t capacity;

    BNode** slots() noexcept { return reinterpret_cast<BNode**>(this + 1); }
};

// What a node keeps its children by, in one word: nothing, the share of an
// only child, which many folders have, or an array. Both are aligned to four
// bytes, so the lowest bit can tell them apart. While a node is released, the
// child's place may hold the node above it, or none.
class ChildStore {
public:
    ChildStore() noexcept = default;
    static ChildStore only(BNode* child) noexcept {
        return ChildStore(reinterpret_cast<std::uintptr_t>(child) | onlyFlag);
    }
    static ChildStore array(ChildBlock* block) noexcept {
        return ChildStore(reinterpret_cast<std::uintptr_t>(block));
    }

    bool isOnly() const noexcept { return (word_ & onlyFlag) != 0; }
    BNode* child() const noexcept {
        return reinterpret_cast<BNode*>(word_ & ~onlyFlag);
    }
    // Null if there is none.
    ChildBlock* block() const noexcept {
        return isOnly() ? nullptr : reinterpret_cast<ChildBlock*>(word_);
    }
    std::size_t size() const noexcept {
        if (isOnly()) return 1;
        return word_ == 0 ? 0 : block()->size;
    }

private:
    static constexpr std::uintptr_t onlyFlag = 1;

    explicit ChildStore(std::uintptr_t value) noexcept : word_(value) {}

    std::uintptr_t word_ = 0;
};

// One component of the trie: its value, its children and its share count,
// in one piece of a slab.
//
//   | children, 8 bytes      | count, 4 | head, 1 | length, 8  | value |
//   | only if made to have   |          |         | only if    |       |
//   | children               |          |         | above 62   |       |
//                            ^ the node's address, a multiple of 4
//
// Most nodes are files and never have children, so a node made as a leaf has
// no room for a child store. If it gets children after all, its slab keeps
// the store for it; the node stays where it is.
//
// Invariants: the value never changes; children are only appended; every
//   child in the list is kept alive by it.
// Ownership: handles (BNodePtr) and the parent's list own shares of a node.
// Threads: the count is atomic, all else must not be read while it changes.
class BNode {
public:
    BNode(const BNode&) = delete;
    BNode& operator=(const BNode&) = delete;

    // The component's encoded bytes, valid as long as the node.
    ComponentView value() const noexcept {
        const std::uint8_t* at = afterHead();
        const unsigned shortLength = head_ >> lengthShift;
        if (shortLength != longLength) return {at, shortLength};
        std::uint64_t length = 0;
        std::memcpy(&length, at, sizeof length);
        return {at + sizeof length, static_cast<std::size_t>(length)};
    }

    ChildList children() const noexcept {
        return ChildList(const_cast<BNode&>(*this));
    }
    bool isLeaf() const noexcept { return children().empty(); }

private:
    friend class BNodePtr;
    friend class ChildList;
    friend class NodePool;
    friend class NodeSlab;
    friend struct NodeMemory;

    static constexpr std::uint8_t ownsStoreFlag = 1;  // before the node
    static constexpr std::uint8_t lateStoreFlag = 2;  // in the slab
    static constexpr unsigned lengthShift = 2;
    static constexpr unsigned longLength = 63;

    BNode() noexcept = default;

    const std::uint8_t* afterHead() const noexcept { return &head_ + 1; }
    std::uint8_t* afterHead() noexcept { return &head_ + 1; }

    void* storeSlot() const noexcept {
        return const_cast<char*>(reinterpret_cast<const char*>(this)) -
               sizeof(ChildStore);
    }
    ChildStore store() const noexcept {
        ChildStore kept;
        if ((head_ & ownsStoreFlag) != 0)
            std::memcpy(&kept, storeSlot(), sizeof kept);
        else if ((head_ & lateStoreFlag) != 0)
            kept = lateStore();
        return kept;
    }
    ChildStore lateStore() const noexcept;
    // Throws std::bad_alloc, with nothing changed, when a node that was made
    // as a leaf gets its first store.
    void setStore(ChildStore kept);

    void share() noexcept {
        references_.fetch_add(1, std::memory_order_relaxed);
    }
    // Gives one share back; true when it was the last.
    bool unshare() noexcept {
        return references_.fetch_sub(1, std::memory_order_acq_rel) == 1;
    }
    // Releases a node whose last share is gone, and all that it alone owns.
    static void destroy(BNode* dead) noexcept;
    BNode* popChild() noexcept;
    void leaveWayUp(BNode* above) noexcept;
    BNode* takeWayUp() noexcept;

    std::atomic<std::uint32_t> references_ = 1;
    std::uint8_t head_ = 0;
};

inline BNodePtr::BNodePtr(BNode* target) noexcept : node_(target) {
    if (node_ != nullptr) node_->share();
}
inline BNodePtr::BNodePtr(const BNodePtr& other) noexcept
    : BNodePtr(other.node_) {}
inline BNodePtr::~BNodePtr() {
    if (node_ != nullptr && node_->unshare()) BNode::destroy(node_);
}
inline BNodePtr BNodePtr::adopt(BNode* owned) noexcept {
    BNodePtr handle;
    handle.node_ = owned;
    return handle;
}

static_assert(alignof(BNode) >= 4 && alignof(ChildBlock) >= 4);

inline std::size_t ChildList::size() const noexcept {
    return owner_->store().size();
}
inline BNode& ChildList::operator[](std::size_t i) const noexcept {
    const ChildStore kept = owner_->store();
    return kept.isOnly() ? *kept.child() : *kept.block()->slots()[i];
}

// Bytes that nodes take, as the allocator counts them.
struct NodeMemory {
    // The node's piece of its slab, its children's array not included.
    static std::size_t nodeBytes(const BNode& node) noexcept;
    // The array of the node's children; 0 if it has no array.
    static std::size_t childListBytes(const BNode& node) noexcept;
    // Identity and size of the slab that the node lives in.
    static std::pair<const void*, std::size_t> slab(const BNode& node) noexcept;
};

}  // namespace tessel
