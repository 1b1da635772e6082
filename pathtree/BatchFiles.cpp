#include "pathtree/BatchFiles.hpp"

#include <stdexcept>

namespace tessel {

BatchFiles BatchFiles::ofRoot(const FolderNode& root) {
    if (root.children().count() == 0)
        throw std::out_of_range("A track leads nowhere.");
    return {root, 0};
}

Child BatchFiles::childAt(const FolderNode* node, std::uint64_t position) {
    if (node == nullptr || position >= node->children().count())
        throw std::out_of_range("A position leads outside the path tree.");
    return node->child(position);
}

void BatchFiles::seek(std::uint64_t position) {
    constexpr std::uint64_t maxSteps = 8;
    if (position >= block_.count())
        throw std::out_of_range("A position leads outside the path tree.");
    if (position < position_ || position - position_ > maxSteps) {
        entryOffset_ = block_.offsetOf(position);
    } else {
        for (; position_ < position; ++position_)
            entryOffset_ += ChildBlock::sizeOf(block_.entries() + entryOffset_,
                                               block_.isPadded());
    }
    position_ = position;
}

}  // namespace tessel
