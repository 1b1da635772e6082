#pragma once

#include <cstddef>
#include <cstdint>

#include "pathtree/FolderNode.hpp"

namespace tessel {

class ChildList;

// One component of the trie, seen from outside: a folder's node, or a file by
// its folder and its position there. A file that becomes a folder stays the
// same node to those who hold it.
//
// Ownership: a plain value that borrows the folder; a BNodePtr keeps it alive.
class BNode {
public:
    explicit BNode(FolderNode& folder) noexcept
        : place_(&folder), position_(itself) {}
    // The child at a position of the folder.
    BNode(FolderNode& parent, std::uint64_t position) noexcept
        : place_(&parent), position_(static_cast<std::uint32_t>(position)) {
        if (FolderNode* folder = parent.child(position).folder)
            *this = BNode(*folder);
    }

    // The file at a position of the folder; it must not be a folder so far.
    static BNode fileAt(FolderNode& parent, std::uint64_t position) noexcept {
        BNode file(parent);
        file.position_ = static_cast<std::uint32_t>(position);
        return file;
    }

    // The component's encoded bytes. A file's are valid until its folder
    // changes.
    ComponentView value() const noexcept { return child().value(); }
    // The node of a folder; null for a file.
    FolderNode* folder() const noexcept { return child().folder; }

    ChildList children() const noexcept;
    bool isLeaf() const noexcept {
        const FolderNode* node = folder();
        return node == nullptr || node->children().count() == 0;
    }

    // Whether it is this folder's child at this position, which there must be.
    bool isChildAt(const FolderNode& parent,
                   std::uint64_t position) const noexcept {
        const FolderNode* const own = folder();
        if (own != nullptr) return parent.child(position).folder == own;
        return place_ == &parent && position_ == position;
    }

    // Prefetches the folder's node, or the file's folder.
    void prefetch() const noexcept { __builtin_prefetch(place_); }

    // The same node, not an equal value.
    friend bool operator==(BNode a, BNode b) noexcept {
        // A file and a folder differ in their places, too.
        FolderNode* const folder = a.folder();
        if (folder != nullptr) return folder == b.folder();
        return a.place_ == b.place_ && a.position_ == b.position_;
    }

private:
    friend class BNodePtr;
    friend class TreeInserter;

    static constexpr std::uint32_t itself = ChildBlock::maxChildren;

    BNode() noexcept = default;

    Child child() const noexcept {
        if (position_ == itself) return {{}, place_};
        return place_->child(position_);
    }

    FolderNode* place_ = nullptr;  // the folder itself, or the file's folder
    std::uint32_t position_ = itself;
};

// The children of one node in the order of insertion: a view, valid as long
// as the node. Children are only ever appended.
class ChildList {
public:
    explicit ChildList(BNode node) noexcept : owner_(node) {}

    std::size_t size() const noexcept {
        const FolderNode* folder = owner_.folder();
        return folder == nullptr
                   ? 0
                   : static_cast<std::size_t>(folder->children().count());
    }
    bool empty() const noexcept { return size() == 0; }
    // The child at position i, which must be below size().
    BNode operator[](std::size_t i) const noexcept {
        return {*owner_.folder(), i};
    }
    BNode back() const noexcept { return (*this)[size() - 1]; }
    BNode node() const noexcept { return owner_; }

    // Reads all children, faster than by position.
    ChildReader reader() const noexcept {
        const FolderNode* folder = owner_.folder();
        return ChildReader(folder == nullptr ? ChildBlock(nullptr)
                                             : folder->children());
    }

private:
    BNode owner_;
};

inline ChildList BNode::children() const noexcept { return ChildList(*this); }

}  // namespace tessel
