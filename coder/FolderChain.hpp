#pragma once

#include <algorithm>
#include <array>
#include <cstddef>
#include <span>

#include "pathtree/FolderNode.hpp"

namespace tessel {

// The folders from below the root down to one, found from the bottom up.
//
// Ownership: borrows the nodes.
// Cost: the folders that are not in the chain that was found before.
class FolderChain {
public:
    static constexpr std::size_t maxDepth = 32;

    // The array is not cleared: an entry is written before it is read.
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-member-init)
    FolderChain() noexcept {}  // NOLINT(modernize-use-equals-default)

    // Becomes the chain of a folder in the tree of this root. False, and an
    // empty chain, if the way up is not known or has more folders.
    bool find(const FolderNode& root, const FolderNode& folder) noexcept {
        folder.prefetchChildren();
        // Not cleared either.
        // NOLINTNEXTLINE(cppcoreguidelines-pro-type-member-init)
        std::array<const FolderNode*, maxDepth> above;
        std::size_t count = 0;
        std::size_t kept = 0;
        for (const FolderNode* at = &folder; at != &root; at = at->parent()) {
            kept = endOf(at);
            if (kept != 0) break;
            if (at == nullptr || count == maxDepth) return fail();
            above[count++] = at;
        }
        if (count > maxDepth - kept) return fail();
        std::reverse_copy(above.begin(), above.begin() + count,
                          folders_.begin() + kept);
        depth_ = kept + count;
        return true;
    }

    // The folders, the one below the root first.
    std::span<const FolderNode* const> folders() const noexcept {
        return {folders_.data(), depth_};
    }

private:
    // The length of the chain that ends at this folder; 0 if it is not in it.
    std::size_t endOf(const FolderNode* folder) const noexcept {
        std::size_t end = depth_;
        while (end > 0 && folders_[end - 1] != folder) --end;
        return end;
    }
    bool fail() noexcept {
        depth_ = 0;
        return false;
    }

    std::array<const FolderNode*, maxDepth> folders_;
    std::size_t depth_ = 0;
};

}  // namespace tessel
