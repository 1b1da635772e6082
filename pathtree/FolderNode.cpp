#include "pathtree/FolderNode.hpp"

#include <cstdlib>
#include <new>
#include <stdexcept>

#include "pathtree/NodeSlab.hpp"
#include "pathtree/allocatedBytes.hpp"

namespace tessel {

// ---- Name ----

std::uint64_t FolderNode::storedLength() const noexcept {
    std::uint64_t length = 0;
    std::memcpy(&length, afterFlags(), sizeof length);
    return length;
}

ComponentView FolderNode::longValue() const noexcept {
    const auto length = static_cast<std::size_t>(storedLength());
    const std::uint8_t* own = ownValue();
    return {own != nullptr ? own : afterFlags() + sizeof(std::uint64_t),
            length};
}

std::uint8_t* FolderNode::afterLongValue() const noexcept {
    const std::uint64_t length = storedLength();
    return afterFlags() + sizeof length +
           (length > maxInSlab ? sizeof(std::uint8_t*) : length);
}

std::uint8_t* FolderNode::ownValue() const noexcept {
    if (lengthAndFlags_ >> lengthShift != longLength ||
        storedLength() <= maxInSlab)
        return nullptr;
    std::uint8_t* block = nullptr;
    std::memcpy(&block, afterFlags() + sizeof(std::uint64_t), sizeof block);
    return block;
}

std::size_t FolderNode::ownValueBytes() const noexcept {
    return allocatedBytes(ownValue());
}

// ---- Children ----

std::uint8_t* FolderNode::ownBlock() const noexcept {
    if ((lengthAndFlags_ & inlineBlock) != 0) return nullptr;
    return children().memory();
}

std::size_t FolderNode::ownChildBytes() const noexcept {
    return allocatedBytes(ownBlock());
}

// From now on the children are in this block on the heap.
void FolderNode::setBlock(std::uint8_t* block) noexcept {
    lengthAndFlags_ = static_cast<std::uint8_t>(lengthAndFlags_ & ~inlineBlock);
    std::memcpy(childPlace(), &block, sizeof block);
}

void FolderNode::append(const ChildBatch& batch) {
    const ChildBlock block = children();
    const std::uint64_t count = block.count();
    if (batch.count > ChildBlock::maxChildren - count)
        throw std::length_error("A folder has too many children.");
    const std::uint64_t bytes = block.bytesFor(batch);
    if (!block.hasRoomFor(batch.count, bytes)) {
        if (ownBlock() != nullptr)
            setBlock(children().grow(batch.count, bytes));
        else
            setBlock(block.grownCopy(batch.count, bytes));
    }
    children().append(batch);
    adopt(batch);
}

void FolderNode::setParent(const FolderNode& parent) noexcept {
    const std::int64_t steps = parent.stepsFrom(*this);
    parent_ = static_cast<std::int32_t>(steps);
    if (parent_ != steps) parent_ = 0;
}

void FolderNode::adopt(const ChildBatch& batch) const noexcept {
    if (!batch.hasFolders) return;
    const std::uint8_t* entry = batch.entries.data();
    for (std::uint64_t left = batch.count; left > 0; --left) {
        if (FolderNode* folder = ChildBlock::read(entry).folder)
            folder->setParent(*this);
        entry += ChildBlock::sizeOf(entry, false);
    }
}

void FolderNode::reservePromotion(std::uint64_t position) {
    const ChildBlock block = children();
    const std::uint8_t* entry = block.entries() + block.offsetOf(position);
    if (ChildBlock::sizeOf(entry, block.isPadded()) <
        ChildBlock::folderEntryBytes) {
        std::uint8_t* const copy = block.paddedCopy();
        std::free(ownBlock());
        setBlock(copy);
    }
}

void FolderNode::trim() noexcept {
    if (ownBlock() != nullptr) setBlock(children().shrink());
}

// ---- Release ----
//
// Pointer reversal (Schorr and Waite 1967): on the way down, the entry that a
// folder was in remembers the parent, so the dead nodes themselves are the
// stack and a tree of any depth is released in constant space.
//
//   alive              b is dead, too     on the way up
//   a -> b -> c        a    b -> c        a    b
//                      ^----'             ^----'
//                      in b's walk, c's entry holds the way back from c

void FolderNode::releaseOwned() noexcept {
    std::free(ownBlock());
    std::free(ownValue());
    NodeSlab::of(this)->release();
}

void FolderNode::destroy(FolderNode* dead) noexcept {
    FolderNode* parent = nullptr;
    dead->children().beginRelease();
    for (;;) {
        ChildBlock block = dead->children();
        if (std::uint8_t* entry = block.nextDeadFolder()) {
            FolderNode* child = ChildBlock::folderAt(entry);
            if (!child->unshare()) continue;
            ChildBlock::setFolderAt(entry, parent);
            parent = dead;
            dead = child;
            dead->children().beginRelease();
            continue;
        }
        dead->releaseOwned();
        if (parent == nullptr) return;
        dead = parent;
        parent = ChildBlock::folderAt(dead->children().currentDeadFolder());
    }
}

}  // namespace tessel
