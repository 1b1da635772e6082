#include "pathtree/NodePool.hpp"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <memory>
#include <new>

#include "pathtree/NodeSlab.hpp"

namespace tessel {

namespace {

struct Free {
    void operator()(void* memory) const noexcept { std::free(memory); }
};
using HeapBytes = std::unique_ptr<std::uint8_t, Free>;

HeapBytes heapBytes(std::size_t count) {
    HeapBytes block(static_cast<std::uint8_t*>(std::malloc(count)));
    if (block == nullptr) throw std::bad_alloc();
    return block;
}

// The name in a heap block, if it is too long for a slab.
HeapBytes ownName(ComponentView name) {
    if (name.size() <= FolderNode::maxInSlab) return nullptr;
    HeapBytes block = heapBytes(name.size());
    std::memcpy(block.get(), name.data(), name.size());
    return block;
}

// The children in a heap block, if they are too many for the node.
HeapBytes ownChildren(const ChildBatch& children) {
    if (children.count == 0) return nullptr;
    const std::size_t bytes = ChildBlock::exactBytes(children);
    if (bytes <= FolderNode::maxInlineBlock) return nullptr;
    HeapBytes block = heapBytes(bytes);
    ChildBlock::write(block.get(), children);
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
void* NodePool::allocate(std::size_t bytes) {
    // An eighth of what was made before: little trees stay little, and no
    // tree has more than that unused.
    constexpr std::size_t growth = 8;
    if (current_ != nullptr)
        if (void* at = current_->allocate(bytes)) return at;
    const std::size_t needed =
        sizeof(NodeSlab) + bytes + NodeSlab::nodeAlignment;
    NodeSlab* next = NodeSlab::create(
        std::clamp(allocated_ / growth, std::max(NodeSlab::minBytes, needed),
                   NodeSlab::maxBytes));
    if (current_ != nullptr) current_->release();
    current_ = next;
    return current_->allocate(bytes);
}

FolderNode* NodePool::make(ComponentView name, const ChildBatch& children) {
    const bool isLong = name.size() >= FolderNode::longLength;
    HeapBytes longName = ownName(name);
    HeapBytes block = ownChildren(children);
    const bool isInline = block == nullptr && children.count > 0;
    // A block that grows leaves the way to the new one in its place.
    const std::size_t childBytes =
        isInline
            ? std::max(ChildBlock::exactBytes(children), sizeof(std::uint8_t*))
            : sizeof(std::uint8_t*);
    const std::size_t bytes =
        offsetof(FolderNode, lengthAndFlags_) + 1 +
        (isLong ? sizeof(std::uint64_t) : 0) +
        (longName != nullptr ? sizeof(std::uint8_t*) : name.size()) +
        childBytes;
    auto* node = new (allocate(bytes)) FolderNode;
    allocated_ += bytes;
    const auto length =
        isLong ? FolderNode::longLength : static_cast<unsigned>(name.size());
    node->lengthAndFlags_ =
        static_cast<std::uint8_t>(length << FolderNode::lengthShift |
                                  (isInline ? FolderNode::inlineBlock : 0U));
    std::uint8_t* at = node->afterFlags();
    if (isLong) at = put(at, std::uint64_t{name.size()});
    if (longName != nullptr)
        at = put(at, longName.release());
    else if (!name.empty())
        at = std::copy(name.begin(), name.end(), at);
    if (isInline)
        ChildBlock::write(at, children);
    else
        put(at, block.release());
    node->adopt(children);
    return node;
}

}  // namespace tessel
