#include "pathtree/ChildIndex.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children are searched from the front: they are one or two
// cache lines, and a name of another length is told apart by one byte. Too
// large costs a look at each child, too small a table for little folders.
constexpr std::size_t maxSearched = 8;

std::size_t searchFromFront(const FolderNode& parent, ComponentView value) {
    ChildReader children(parent.children());
    for (std::size_t i = 0; !children.atEnd(); ++i)
        if (sameComponent(children.next().value(), value)) return i;
    return ChildIndex::notFound;
}

}  // namespace

std::size_t ChildIndex::Table::indexNewChildren(const FolderNode& parent) {
    const ChildBlock block = parent.children();
    const auto count = static_cast<std::size_t>(block.count());
    const std::size_t fresh = count - size_;
    if (fresh > 1) positions_.reserve(count);
    ChildReader children(block, size_);
    for (; size_ < count; ++size_) {
        const ComponentView value = children.next().value();
        const std::uint32_t hash = HashIndex::hashOf(value);
        // An equal child that came earlier is the one to find.
        if (find(parent, value, hash) == notFound)
            positions_.insert(hash, size_);
    }
    return fresh;
}

std::size_t ChildIndex::Table::find(const FolderNode& parent,
                                    ComponentView value,
                                    std::uint32_t hash) const {
    return positions_.find(hash, [&](std::size_t position) {
        return sameComponent(parent.child(position).value(), value);
    });
}

std::size_t ChildIndex::find(FolderNode& parent, ComponentView value) {
    if (parent.children().count() <= maxSearched)
        return searchFromFront(parent, value);
    Table& table = tables_[&parent];
    indexedChildren_ += table.indexNewChildren(parent);
    return table.find(parent, value, HashIndex::hashOf(value));
}

void ChildIndex::clear() noexcept {
    releaseContents(tables_);
    indexedChildren_ = 0;
}

std::size_t ChildIndex::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const FolderNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes = tables_.size() * mapNode;
    if (!tables_.empty()) bytes += tables_.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables_) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
