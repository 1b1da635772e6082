#pragma once

#include <utility>

#include "pathtree/BNode.hpp"

namespace tessel {

// Shared ownership of one node: 8 bytes; the count is in the node.
//
// Threads: counts are atomic, so handles to one node may be copied and
// released on different threads. Releasing the last handle releases what the
// node owns, without recursion and without allocating memory.
class BNodePtr {
public:
    BNodePtr() noexcept = default;
    // Takes a new share.
    explicit BNodePtr(BNode* target) noexcept : node_(target) {
        if (node_ != nullptr) node_->share();
    }
    BNodePtr(const BNodePtr& other) noexcept : BNodePtr(other.node_) {}
    BNodePtr(BNodePtr&& other) noexcept
        : node_(std::exchange(other.node_, nullptr)) {}
    BNodePtr& operator=(BNodePtr other) noexcept {
        std::swap(node_, other.node_);
        return *this;
    }
    ~BNodePtr() {
        if (node_ != nullptr && node_->unshare()) BNode::destroy(node_);
    }

    // The handle that takes over a share which the caller owns.
    static BNodePtr adopt(BNode* owned) noexcept {
        BNodePtr handle;
        handle.node_ = owned;
        return handle;
    }
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

}  // namespace tessel
