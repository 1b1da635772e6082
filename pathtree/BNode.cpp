#include "pathtree/BNode.hpp"

#include <cstdlib>

#include "pathtree/NodeSlab.hpp"
#include "pathtree/allocatedBytes.hpp"

namespace tessel {

// ---- Value ----

ComponentView BNode::longValue() const noexcept {
    std::uint64_t length = 0;
    std::memcpy(&length, afterFlags(), sizeof length);
    const std::uint8_t* at = afterFlags() + sizeof length;
    if (length > maxInSlab) at = ownValue();
    return {at, static_cast<std::size_t>(length)};
}

std::uint8_t* BNode::ownValue() const noexcept {
    if (lengthAndFlags_ >> lengthShift != longLength) return nullptr;
    std::uint64_t length = 0;
    std::memcpy(&length, afterFlags(), sizeof length);
    if (length <= maxInSlab) return nullptr;
    std::uint8_t* block = nullptr;
    std::memcpy(&block, afterFlags() + sizeof length, sizeof block);
    return block;
}

// ---- Children ----

ChildStore BNode::slabStore() const noexcept {
    return NodeSlab::of(this)->childStore(this);
}

void BNode::setSlabStore(ChildStore kept) {
    NodeSlab::of(this)->setChildStore(this, kept);
    lengthAndFlags_ = static_cast<std::uint8_t>(lengthAndFlags_ | hasSlabStore);
}

std::size_t BNode::childListBytes() const noexcept {
    return allocatedBytes(store().block());
}

std::size_t BNode::ownValueBytes() const noexcept {
    return allocatedBytes(ownValue());
}

// ---- Release ----
//
// Pointer reversal (Schorr and Waite 1967): on the way down, the place that
// a child was in remembers the parent, so the dead nodes themselves are the
// stack and a tree of any depth is released in constant space.
//
//   alive              child popped         on the way up
//   a -> b -> c        a    b    c          a    b
//                      ^----'               ^----'
//                      stashed in b's slot

// Takes the last child, of which there must be one, out of the list; its
// share goes to the caller.
BNode* BNode::popChild() noexcept {
    const ChildStore kept = store();
    if (!kept.isOnly()) return kept.block()->slots()[--kept.block()->size];
    setStore(ChildStore());
    return kept.child();
}

// Remembers the parent, or none, in the place that popChild made free.
inline void BNode::stashParent(BNode* parent) noexcept {
    ChildBlock* block = store().block();
    if (block != nullptr)
        block->slots()[block->size] = parent;
    else
        setStore(ChildStore::only(parent));
}

inline BNode* BNode::unstashParent() noexcept {
    const ChildStore kept = store();
    if (!kept.isOnly()) return kept.block()->slots()[kept.block()->size];
    setStore(ChildStore());
    return kept.child();
}

inline void BNode::releaseOwned() noexcept {
    if (ChildBlock* block = store().block()) std::free(block);
    if (lengthAndFlags_ >> lengthShift == longLength) std::free(ownValue());
    NodeSlab* slab = NodeSlab::of(this);
    if ((lengthAndFlags_ & hasSlabStore) != 0) slab->forgetChildStore(this);
    slab->release();
}

void BNode::destroy(BNode* dead) noexcept {
    BNode* parent = nullptr;
    for (;;) {
        if (!dead->isLeaf()) {
            BNode* child = dead->popChild();
            if (!child->unshare()) continue;
            dead->stashParent(parent);
            parent = dead;
            dead = child;
            continue;
        }
        dead->releaseOwned();
        if (parent == nullptr) return;
        dead = parent;
        parent = dead->unstashParent();
    }
}

}  // namespace tessel
