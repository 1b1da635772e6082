#include "pathtree/NodeStack.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

// The entry of the child on top. Its offset is looked up anew if the children
// were laid out anew since, which happens once at most.
const std::uint8_t* NodeStack::topEntry() const noexcept {
    const Range& range = ranges_.back();
    const ChildBlock block = range.node->folder()->children();
    const std::uint64_t offset = block.isPadded() == range.isPadded
                                     ? range.offset
                                     : block.offsetOf(range.next);
    return block.entries() + offset;
}

Child NodeStack::topChild() const noexcept {
    const Range& range = ranges_.back();
    if (!range.isNode) return ChildBlock::read(topEntry());
    FolderNode* const folder = range.node->folder();
    return folder != nullptr ? Child{{}, folder}
                             : Child{range.node->value(), nullptr};
}

void NodeStack::pushChildren(const BNodePtr& node) {
    FolderNode* const folder = node->folder();
    if (folder == nullptr) return;
    const ChildBlock block = folder->children();
    const auto count = static_cast<std::uint32_t>(block.count());
    if (count > 0)
        ranges_.push_back({BNodePtr(BNode(*folder)), 0, 0, count, false,
                           block.isPadded()});
}

void NodeStack::pop() noexcept {
    Range& range = ranges_.back();
    if (++range.next == range.end) {
        ranges_.pop_back();
        return;
    }
    const ChildBlock block = range.node->folder()->children();
    if (block.isPadded() == range.isPadded) {
        range.offset += ChildBlock::sizeOf(block.entries() + range.offset,
                                           range.isPadded);
    } else {
        range.isPadded = block.isPadded();
        range.offset = block.offsetOf(range.next);
    }
}

void NodeStack::grow(std::size_t more) { reserveGently(ranges_, more); }

}  // namespace tessel
