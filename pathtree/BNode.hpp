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
        : node(std::exchange(other.node, nullptr)) {}
    BNodePtr& operator=(BNodePtr other) noexcept {
        std::swap(node, other.node);
        return *this;
    }
    ~BNodePtr();

    // The handle that takes over a share which the caller owns.
    static BNodePtr adopt(BNode* owned) noexcept;
    // Hands the share over to the caller and leaves the handle empty.
    BNode* release() noexcept { return std::exchange(node, nullptr); }

    BNode* get() const noexcept { return node; }
    BNode& operator*() const noexcept { return *node; }
    BNode* operator->() const noexcept { return node; }
    explicit operator bool() const noexcept { return node != nullptr; }
    friend bool operator==(const BNodePtr& a, const BNodePtr& b) noexcept {
        return a.node == b.node;
    }

private:
    BNode* node = nullptr;
};

// The children of one node in the order of insertion: a view, valid as long
// as the node. Children are only ever appended.
class ChildList {
public:
    explicit ChildList(BNode& node) noexcept : owner(&node) {}

    std::size_t size() const noexcept;
    bool empty() const noexcept { return size() == 0; }
    // The child at position i, which must be below size().
    BNode& operator[](std::size_t i) const noexcept;
    BNode& back() const noexcept { return (*this)[size() - 1]; }
    BNode& node() const noexcept { return *owner; }

private:
    BNode* owner;
};

// The array that a node's children stand in: one allocation, owned by the
// node, of which each used slot owns a share of a child.
struct ChildBlock {
    std::uint32_t size;
    std::uint32_t capacity;

    BNode** slots() noexcept { return reinterpret_cast<BNode**>(this + 1); }
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
// no room for a child list. If it gets children after all, its slab keeps
// the list for it (NodeSlab::lateChildren); the node stays where it is.
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
        const unsigned shortLength = head >> lengthShift;
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

    static constexpr std::uint8_t ownsListFlag = 1;  // list before the node
    static constexpr std::uint8_t lateListFlag = 2;  // list in the slab
    static constexpr unsigned lengthShift = 2;
    static constexpr unsigned longLength = 63;

    BNode() noexcept = default;

    const std::uint8_t* afterHead() const noexcept { return &head + 1; }
    std::uint8_t* afterHead() noexcept { return &head + 1; }

    void* listSlot() const noexcept {
        return const_cast<char*>(reinterpret_cast<const char*>(this)) -
               sizeof(ChildBlock*);
    }
    ChildBlock* block() const noexcept {
        if ((head & ownsListFlag) != 0) {
            ChildBlock* list = nullptr;
            std::memcpy(&list, listSlot(), sizeof list);
            return list;
        }
        return (head & lateListFlag) != 0 ? lateBlock() : nullptr;
    }
    ChildBlock* lateBlock() const noexcept;
    void setBlock(ChildBlock* list);

    void share() noexcept {
        references.fetch_add(1, std::memory_order_relaxed);
    }
    // Gives one share back; true when it was the last.
    bool unshare() noexcept {
        return references.fetch_sub(1, std::memory_order_acq_rel) == 1;
    }
    // Releases a node whose last share is gone, and all that it alone owns.
    static void destroy(BNode* dead) noexcept;

    std::atomic<std::uint32_t> references = 1;
    std::uint8_t head = 0;
};

inline BNodePtr::BNodePtr(BNode* target) noexcept : node(target) {
    if (node != nullptr) node->share();
}
inline BNodePtr::BNodePtr(const BNodePtr& other) noexcept
    : BNodePtr(other.node) {}
inline BNodePtr::~BNodePtr() {
    if (node != nullptr && node->unshare()) BNode::destroy(node);
}
inline BNodePtr BNodePtr::adopt(BNode* owned) noexcept {
    BNodePtr handle;
    handle.node = owned;
    return handle;
}

inline std::size_t ChildList::size() const noexcept {
    const ChildBlock* list = owner->block();
    return list == nullptr ? 0 : list->size;
}
inline BNode& ChildList::operator[](std::size_t i) const noexcept {
    return *owner->block()->slots()[i];
}

// Bytes that nodes take, as the allocator counts them.
struct NodeMemory {
    // The node's piece of its slab, its children's array not included.
    static std::size_t nodeBytes(const BNode& node) noexcept;
    // The array of the node's children; 0 if it has none.
    static std::size_t childListBytes(const BNode& node) noexcept;
    // Identity and size of the slab that the node lives in.
    static std::pair<const void*, std::size_t> slab(const BNode& node) noexcept;
};

}  // namespace tessel
