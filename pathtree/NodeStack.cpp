#include "pathtree/NodeStack.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

bool NodeStack::isTopLastFileOf(const FolderNode& parent) const noexcept {
    if (ranges_.empty()) return false;
    const Range& range = ranges_.back();
    const std::uint64_t children = parent.children().count();
    if (children == 0) return false;
    if (range.isNode) return range.node->isChildAt(parent, children - 1);
    return range.node->folder() == &parent && range.next == children - 1;
}

void NodeStack::pushChildren(const BNodePtr& node) {
    FolderNode* const folder = node->folder();
    if (folder == nullptr) return;
    const ChildBlock block = folder->children();
    const auto count = static_cast<std::uint32_t>(block.count());
    if (count > 0)
        ranges_.push_back(
            {BNodePtr(BNode(*folder)), 0, 0, count, false, block.isPadded()});
}

void NodeStack::pop() noexcept {
    if (ranges_.empty()) return;
    Range& range = ranges_.back();
    if (++range.next == range.end) {
        ranges_.pop_back();
        return;
    }
    const ChildBlock block = range.node->folder()->children();
    if (block.isPadded() == range.isPadded) {
        range.offset +=
            ChildBlock::sizeOf(block.entries() + range.offset, range.isPadded);
    } else {
        range.isPadded = block.isPadded();
        range.offset = block.offsetOf(range.next);
    }
}

void NodeStack::grow(std::size_t more) { reserveGently(ranges_, more); }

}  // namespace tessel
