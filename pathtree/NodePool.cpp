#include "pathtree/NodePool.hpp"

#include <algorithm>
#include <cstdlib>
#include <limits>
#include <memory>
#include <new>
#include <stdexcept>

#include "pathtree/NodeSlab.hpp"

namespace tessel {

namespace {

struct Free {
    void operator()(void* memory) const noexcept { std::free(memory); }
};
using HeapBytes = std::unique_ptr<std::uint8_t, Free>;

// The value in a heap block, if it is too long for a slab.
HeapBytes ownBlock(ComponentView value) {
    if (value.size() <= BNode::maxInSlab) return nullptr;
    HeapBytes block(static_cast<std::uint8_t*>(std::malloc(value.size())));
    if (block == nullptr) throw std::bad_alloc();
    std::memcpy(block.get(), value.data(), value.size());
    return block;
}

// Writes an integer or a pointer at the place and returns what is after it.
template <class T>
std::uint8_t* put(std::uint8_t* at, T value) {
    std::memcpy(at, &value, sizeof value);
    return at + sizeof value;
}

}  // namespace

NodePool::~NodePool() {
    if (current_ != nullptr) current_->release();
}

// The address of a new node, which the slab counts from now on.
void* NodePool::allocate(std::size_t before, std::size_t bytes) {
    // An eighth of what was made before: little trees stay little, and no
    // tree has more than that unused.
    constexpr std::size_t growth = 8;
    if (current_ != nullptr)
        if (void* at = current_->allocate(before, bytes)) return at;
    const std::size_t needed =
        sizeof(NodeSlab) + before + bytes + NodeSlab::nodeAlignment;
    NodeSlab* next = NodeSlab::create(
        std::clamp(allocated_ / growth, std::max(NodeSlab::minBytes, needed),
                   NodeSlab::maxBytes));
    if (current_ != nullptr) current_->release();
    current_ = next;
    return current_->allocate(before, bytes);
}

BNode* NodePool::make(ComponentView value, Kind kind) {
    const bool isLong = value.size() >= BNode::longLength;
    HeapBytes block = ownBlock(value);
    const std::size_t before = kind == Kind::folder ? sizeof(ChildStore) : 0;
    const std::size_t bytes =
        offsetof(BNode, lengthAndFlags_) + 1 +
        (isLong ? sizeof(std::uint64_t) : 0) +
        (block != nullptr ? sizeof(std::uint8_t*) : value.size());
    auto* node = new (allocate(before, bytes)) BNode;
    allocated_ += before + bytes;
    const auto length =
        isLong ? BNode::longLength : static_cast<unsigned>(value.size());
    const unsigned flags = kind == Kind::folder ? BNode::hasPrefixSlot : 0U;
    node->lengthAndFlags_ =
        static_cast<std::uint8_t>(length << BNode::lengthShift | flags);
    if (kind == Kind::folder) node->setStore(ChildStore());
    std::uint8_t* at = node->afterFlags();
    if (isLong) at = put(at, std::uint64_t{value.size()});
    if (block != nullptr)
        put(at, block.release());
    else if (!value.empty())
        std::memcpy(at, value.data(), value.size());
    return node;
}

void NodePool::reserve(BNode& parent, std::size_t count) {
    constexpr std::size_t maxChildren =
        std::numeric_limits<std::uint32_t>::max();
    const ChildStore kept = parent.store();
    const std::size_t size = kept.size();
    if (count > maxChildren - size)
        throw std::length_error("A folder has too many children.");
    // An only child needs no array.
    const std::size_t room =
        kept.block() == nullptr ? 1 : kept.block()->capacity;
    if (size + count <= room) return;
    // A quarter more than needed keeps single appends linear; a first list
    // is exact. So a list takes 8 to 10 bytes per child, and while it is
    // copied both lists are there.
    const std::size_t capacity =
        size == 0 ? count
                  : std::min(maxChildren,
                             std::max(size + count, size + size / 4 + 1));
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

// Appends child to the children of parent, whose list takes over the
// handle's share. Throws as reserve does, with nothing changed.
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

}  // namespace tessel
