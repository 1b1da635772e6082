#include "pathtree/BatchFiles.hpp"

#include <stdexcept>

namespace tessel {

BatchFiles BatchFiles::ofRoot(const FolderNode* root) {
    if (root == nullptr || root->children().count() == 0)
        throw std::out_of_range("A track leads nowhere.");
    return {*root, 0};
}

Child BatchFiles::childAt(const FolderNode* node, std::uint64_t position) {
    if (node == nullptr || position >= node->children().count())
        throw std::out_of_range("A position leads outside the path tree.");
    return node->child(position);
}

void BatchFiles::seek(std::uint64_t position) {
    if (position >= count_)
        throw std::out_of_range("A position leads outside the path tree.");
    entry_ = block_.entries() + block_.offsetOf(position);
    position_ = position;
}

}  // namespace tessel
