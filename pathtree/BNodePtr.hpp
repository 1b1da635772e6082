#pragma once

#include <utility>

#include "pathtree/BNode.hpp"

namespace tessel {

// Shared ownership of one node: 16 bytes; the count is in the folder's node.
// A handle to a file keeps the file's folder alive.
//
// Threads: counts are atomic, so handles to one node may be copied and
// released on different threads. Releasing the last handle releases what the
// node owns, without recursion and without allocating memory.
class BNodePtr {
public:
    BNodePtr() noexcept = default;
    // Takes a new share.
    explicit BNodePtr(BNode target) noexcept : node_(target) { share(); }
    BNodePtr(const BNodePtr& other) noexcept : node_(other.node_) { share(); }
    BNodePtr(BNodePtr&& other) noexcept
        : node_(std::exchange(other.node_, BNode())) {}
    BNodePtr& operator=(BNodePtr other) noexcept {
        std::swap(node_, other.node_);
        return *this;
    }
    ~BNodePtr() {
        if (node_.place_ != nullptr) node_.place_->release();
    }

    // The handle that takes over a share which the caller owns.
    static BNodePtr adopt(FolderNode* owned) noexcept {
        BNodePtr handle;
        handle.node_.place_ = owned;
        return handle;
    }
    // Hands the share of a folder over to the caller and leaves the handle
    // empty.
    FolderNode* release() noexcept {
        return std::exchange(node_, BNode()).place_;
    }

    const BNode& operator*() const noexcept { return node_; }
    const BNode* operator->() const noexcept { return &node_; }
    explicit operator bool() const noexcept { return node_.place_ != nullptr; }
    friend bool operator==(const BNodePtr& a, const BNodePtr& b) noexcept {
        if (!a || !b) return !a && !b;
        return a.node_ == b.node_;
    }

private:
    void share() noexcept {
        if (node_.place_ != nullptr) node_.place_->share();
    }

    BNode node_;
};

}  // namespace tessel
