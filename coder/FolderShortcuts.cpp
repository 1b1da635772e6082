#include "coder/FolderShortcuts.hpp"

#include <limits>

#include "pathtree/containers.hpp"

namespace tessel {

void FolderShortcuts::reserveFor(std::size_t k) {
    if (k >= entries_.size()) reserveGently(entries_, k + 1 - entries_.size());
}

void FolderShortcuts::note(std::size_t k, BNode root,
                           Shortcut shortcut) noexcept {
    if (!root_ || root_->folder() != root.folder()) {
        entries_.clear();
        root_ = BNodePtr(root);
    }
    constexpr std::int64_t furthest =
        std::numeric_limits<std::int32_t>::max() / 2;
    std::int32_t entry = unknown;
    if (shortcut.folder != nullptr) {
        const std::int64_t steps = shortcut.folder->stepsFrom(*root.folder());
        if (steps >= -furthest && steps <= furthest)
            entry =
                static_cast<std::int32_t>(2 * steps + (shortcut.isEnd ? 1 : 0));
    }
    entries_.resize(k, unknown);
    entries_.push_back(entry);
}

}  // namespace tessel
