#include "pathtree/NodePool.hpp"

#include <malloc.h>

#include <algorithm>
#include <cstdlib>
#include <limits>
#include <memory>
#include <mutex>
#include <new>
#include <stdexcept>
#include <unordered_map>

namespace tessel {

namespace {

// A node finds its slab by clearing the low bits of its address, so every
// node starts within the first slabAlignment bytes of its slab.
constexpr std::size_t slabAlignment = std::size_t{16} << 10;

// Leaves room for the allocator's own header, so that slabs which follow
// each other in memory waste no space between them.
constexpr std::size_t largestSlab = slabAlignment - 64;
constexpr std::size_t smallestSlab = 1024 - 64;

constexpr std::size_t nodeAlignment = 4;

constexpr std::size_t roundUp(std::size_t n, std::size_t unit) {
    return (n + unit - 1) / unit * unit;
}

std::size_t allocatedBytes(void* memory) noexcept {
    return memory == nullptr ? 0
                             : malloc_usable_size(memory) + sizeof(std::size_t);
}

// Child stores of nodes that were made as leaves, by the node's address.
struct LateStores {
    std::mutex access;  // nodes may be released on several threads
    std::unordered_map<const BNode*, ChildStore> stores;

    // What the allocator gave out for this, but not for the arrays.
    std::size_t bytes() noexcept {
        // The map chains nodes of a link and its value, of 24 bytes, for
        // which the allocator takes 32.
        constexpr std::size_t mapNode = 32;
        return allocatedBytes(this) + stores.size() * mapNode +
               stores.bucket_count() * sizeof(void*) + sizeof(std::size_t);
    }
};

}  // namespace

// One aligned piece of memory that nodes are cut from, front to back.
class NodeSlab {
public:
    static NodeSlab* create(std::size_t bytes) {
        void* memory = nullptr;
        if (posix_memalign(&memory, slabAlignment, bytes) != 0)
            throw std::bad_alloc();
        return new (memory) NodeSlab(bytes);
    }

    static NodeSlab* of(const BNode* node) noexcept {
        const auto address = reinterpret_cast<std::uintptr_t>(node);
        return reinterpret_cast<NodeSlab*>(address & ~(slabAlignment - 1));
    }

    // A place for `before` + `bytes` bytes, or nullptr if none is left. The
    // place counts as a node until release().
    char* cut(std::size_t before, std::size_t bytes) noexcept {
        const std::size_t total = roundUp(before + bytes, nodeAlignment);
        if (total > size_ - used_) return nullptr;
        char* at = reinterpret_cast<char*>(this) + used_ + before;
        used_ += total;
        live_.fetch_add(1, std::memory_order_relaxed);
        return at;
    }

    // Gives back one node, or the pool's own hold.
    void release() noexcept {
        if (live_.fetch_sub(1, std::memory_order_acq_rel) != 1) return;
        this->~NodeSlab();
        std::free(this);
    }

    ChildStore lateStore(const BNode* node) noexcept {
        const std::lock_guard lock(late_->access);
        return late_->stores.find(node)->second;
    }
    void setLateStore(const BNode* node, ChildStore kept) {
        if (late_ == nullptr) late_ = std::make_unique<LateStores>();
        const std::lock_guard lock(late_->access);
        late_->stores[node] = kept;
    }
    void forgetLateStore(const BNode* node) noexcept {
        const std::lock_guard lock(late_->access);
        late_->stores.erase(node);
    }

    // What the allocator gave out for the slab and the stores that it keeps.
    std::size_t bytes() noexcept {
        return allocatedBytes(this) + (late_ == nullptr ? 0 : late_->bytes());
    }

private:
    explicit NodeSlab(std::size_t bytes) noexcept : size_(bytes) {}

    std::atomic<std::size_t> live_{1};  // nodes, and 1 while a pool fills it
    std::size_t size_;
    std::size_t used_ = sizeof(NodeSlab);
    std::unique_ptr<LateStores> late_;
};

ChildStore BNode::lateStore() const noexcept {
    return NodeSlab::of(this)->lateStore(this);
}

void BNode::setStore(ChildStore kept) {
    if ((head_ & ownsStoreFlag) != 0) {
        std::memcpy(storeSlot(), &kept, sizeof kept);
    } else {
        NodeSlab::of(this)->setLateStore(this, kept);
        head_ = static_cast<std::uint8_t>(head_ | lateStoreFlag);
    }
}

// Takes the last child, of which there must be one, out of the list; its
// share goes to the caller.
BNode* BNode::popChild() noexcept {
    const ChildStore kept = store();
    if (!kept.isOnly()) return kept.block()->slots()[--kept.block()->size];
    setStore(ChildStore());
    return kept.child();
}

// Remembers the way up, or none, in the place that popChild made free.
void BNode::leaveWayUp(BNode* above) noexcept {
    ChildBlock* block = store().block();
    if (block != nullptr)
        block->slots()[block->size] = above;
    else
        setStore(ChildStore::only(above));
}

BNode* BNode::takeWayUp() noexcept {
    const ChildStore kept = store();
    if (!kept.isOnly()) return kept.block()->slots()[kept.block()->size];
    setStore(ChildStore());
    return kept.child();
}

// Walks down and up through the dead nodes. On the way down the place that a
// child stood in remembers the way up: the nodes themselves are the stack.
void BNode::destroy(BNode* dead) noexcept {
    BNode* above = nullptr;
    for (;;) {
        if (!dead->isLeaf()) {
            BNode* child = dead->popChild();
            if (!child->unshare()) continue;
            dead->leaveWayUp(above);
            above = dead;
            dead = child;
            continue;
        }
        const ChildStore emptied = dead->store();
        if ((dead->head_ & lateStoreFlag) != 0)
            NodeSlab::of(dead)->forgetLateStore(dead);
        std::free(emptied.block());
        NodeSlab::of(dead)->release();
        if (above == nullptr) return;
        dead = above;
        above = dead->takeWayUp();
    }
}

NodePool::~NodePool() {
    if (current_ != nullptr) current_->release();
}

void* NodePool::allocate(std::size_t before, std::size_t bytes) {
    if (current_ != nullptr)
        if (char* at = current_->cut(before, bytes)) return at;
    const std::size_t needed =
        roundUp(before + bytes, nodeAlignment) + sizeof(NodeSlab);
    if (needed > largestSlab / 4) {  // a slab of its own
        NodeSlab* own = NodeSlab::create(needed);
        char* at = own->cut(before, bytes);
        own->release();
        // NOLINTNEXTLINE(clang-analyzer-unix.Malloc): the cut holds a share
        return at;
    }
    NodeSlab* next = NodeSlab::create(
        std::clamp(made_ / 8, std::max(smallestSlab, needed), largestSlab));
    if (current_ != nullptr) current_->release();
    current_ = next;
    return current_->cut(before, bytes);
}

BNode* NodePool::make(ComponentView value, Kind kind) {
    const bool isLong = value.size() >= BNode::longLength;
    const std::size_t before = kind == Kind::folder ? sizeof(ChildStore) : 0;
    const std::size_t bytes = offsetof(BNode, head_) + 1 +
                              (isLong ? sizeof(std::uint64_t) : 0) +
                              value.size();
    auto* node = new (allocate(before, bytes)) BNode;
    made_ += before + bytes;
    unsigned head =
        (isLong ? BNode::longLength : static_cast<unsigned>(value.size()))
        << BNode::lengthShift;
    if (kind == Kind::folder) {
        head |= BNode::ownsStoreFlag;
        const ChildStore none;
        std::memcpy(node->storeSlot(), &none, sizeof none);
    }
    node->head_ = static_cast<std::uint8_t>(head);
    std::uint8_t* at = node->afterHead();
    if (isLong) {
        const std::uint64_t length = value.size();
        std::memcpy(at, &length, sizeof length);
        at += sizeof length;
    }
    if (!value.empty()) std::memcpy(at, value.data(), value.size());
    return node;
}

void NodePool::reserve(BNode& parent, std::size_t count) {
    constexpr std::size_t most = std::numeric_limits<std::uint32_t>::max();
    const ChildStore kept = parent.store();
    const std::size_t size = kept.size();
    if (count > most - size)
        throw std::length_error("A folder has too many children.");
    // An only child needs no array.
    const std::size_t room =
        kept.block() == nullptr ? 1 : kept.block()->capacity;
    if (size + count <= room) return;
    // A quarter more than needed keeps single appends linear; a first list
    // is exact.
    const std::size_t capacity =
        size == 0 ? count
                  : std::min(most, std::max(size + count, size + size / 4 + 1));
    if (kept.block() == nullptr) parent.setStore(kept);  // may throw, so first
    void* memory = std::realloc(kept.block(),
                                sizeof(ChildBlock) + capacity * sizeof(BNode*));
    if (memory == nullptr) throw std::bad_alloc();
    auto* grown = static_cast<ChildBlock*>(memory);
    if (kept.isOnly()) grown->slots()[0] = kept.child();
    grown->size = static_cast<std::uint32_t>(size);
    grown->capacity = static_cast<std::uint32_t>(capacity);
    parent.setStore(ChildStore::array(grown));
}

BNode& NodePool::add(BNode& parent, ComponentView value, Kind kind) {
    BNodePtr handle = BNodePtr::adopt(make(value, kind));
    BNode& child = *handle;
    append(parent, handle);
    return child;
}

void NodePool::append(BNode& parent, BNodePtr& child) {
    ChildBlock* block = parent.store().block();
    if (block == nullptr || block->size == block->capacity) {
        reserve(parent, 1);
        block = parent.store().block();
    }
    if (block != nullptr) {
        block->slots()[block->size++] = child.release();
    } else {
        parent.setStore(ChildStore::only(child.get()));
        child.release();
    }
}

void NodePool::truncate(BNode& parent, std::size_t size) noexcept {
    while (parent.children().size() > size) BNodePtr::adopt(parent.popChild());
}

std::size_t NodeMemory::nodeBytes(const BNode& node) noexcept {
    const bool isLong = node.head_ >> BNode::lengthShift == BNode::longLength;
    const bool ownsStore = (node.head_ & BNode::ownsStoreFlag) != 0;
    return roundUp(
        (ownsStore ? sizeof(ChildStore) : 0) + offsetof(BNode, head_) + 1 +
            (isLong ? sizeof(std::uint64_t) : 0) + node.value().size(),
        nodeAlignment);
}

std::size_t NodeMemory::childListBytes(const BNode& node) noexcept {
    return allocatedBytes(node.store().block());
}

std::pair<const void*, std::size_t> NodeMemory::slab(
    const BNode& node) noexcept {
    NodeSlab* slab = NodeSlab::of(&node);
    return {slab, slab->bytes()};
}

}  // namespace tessel
