#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/BNodePtr.hpp"

namespace tessel {

// A stack of nodes. All children of a node, pushed together, are kept as one
// range of positions, so that pushing a folder of a million files is one
// step and takes no memory for the files. The top of an empty stack is no node:
// it has no folder, no children and an empty name.
//
// Ownership: the stack keeps its nodes alive, children through their parent.
//   A copy shares them.
// Cost: every operation is O(1).
class NodeStack {
public:
    bool empty() const noexcept { return ranges_.empty(); }

    // The number of nodes on the stack. Cost: linear in the ranges.
    std::size_t size() const noexcept {
        std::size_t count = 0;
        for (const Range& range : ranges_) count += range.end - range.next;
        return count;
    }

    // The node on top.
    BNode top() const noexcept {
        if (ranges_.empty()) return *BNodePtr();
        const Range& range = ranges_.back();
        if (range.isNode) return *range.node;
        const Child child = topChild();
        return child.folder != nullptr
                   ? BNode(*child.folder)
                   : BNode::fileAt(*range.node->folder(), range.next);
    }
    // What it is, without a search for its position.
    Child topChild() const noexcept {
        if (ranges_.empty()) return {};
        const Range& range = ranges_.back();
        if (!range.isNode) return ChildBlock::read(topEntry());
        FolderNode* const folder = range.node->folder();
        return folder != nullptr ? Child{{}, folder}
                                 : Child{range.node->value(), nullptr};
    }
    // Whether the file on top is the last child of this folder.
    bool isTopLastFileOf(const FolderNode& parent) const noexcept;

    void push(const BNodePtr& node) {
        ranges_.push_back({node, 0, 0, 1, true, false});
    }

    // Pushes the node's present children from the last to the first, so that
    // the first is on top. Children appended later are not on the stack.
    void pushChildren(const BNodePtr& node);

    // Takes the top off, if there is one.
    void pop() noexcept;

    void clear() noexcept { ranges_.clear(); }

    // Makes sure that the next `more` pushes do not throw.
    void reserve(std::size_t more) {
        if (more > ranges_.capacity() - ranges_.size()) grow(more);
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return ranges_.capacity() * sizeof(Range);
    }

private:
    // A node itself, or its children at the positions [next, end). `end` is
    // that of the push: the node may have more children by now.
    struct Range {
        BNodePtr node;
        std::uint64_t offset;  // of the entry of child `next`
        std::uint32_t next;
        std::uint32_t end;
        bool isNode;
        bool isPadded;  // the layout of the block that the offset is for
    };

    // The entry of the child on top. Its offset is looked up anew if the
    // children were laid out anew since, which happens once at most.
    const std::uint8_t* topEntry() const noexcept {
        const Range& range = ranges_.back();
        const ChildBlock block = range.node->folder()->children();
        const std::uint64_t offset = block.isPadded() == range.isPadded
                                         ? range.offset
                                         : block.offsetOf(range.next);
        return block.entries() + offset;
    }
    void grow(std::size_t more);

    std::vector<Range> ranges_;
};

}  // namespace tessel
