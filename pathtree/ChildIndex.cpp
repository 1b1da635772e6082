#include "pathtree/ChildIndex.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children are searched from the front: their slots are one
// cache line, and a value of another length is told apart by one byte. Too
// large costs a look at each child, too small a table for little folders.
constexpr std::size_t maxSearched = 8;

std::size_t searchFromFront(const ChildList& children, ComponentView value) {
    const std::size_t count = children.size();
    for (std::size_t i = 0; i < count; ++i)
        if (sameComponent(children[i].value(), value)) return i;
    return ChildIndex::notFound;
}

}  // namespace

std::size_t ChildIndex::Table::indexNewChildren(const ChildList& children) {
    const std::size_t fresh = children.size() - size_;
    if (fresh > 1) positions_.reserve(children.size());
    for (; size_ < children.size(); ++size_) {
        const ComponentView value = children[size_].value();
        const std::uint32_t hash = HashIndex::hashOf(value);
        // An equal child that came earlier is the one to find.
        if (find(children, value, hash) == notFound)
            positions_.insert(hash, size_);
    }
    return fresh;
}

std::size_t ChildIndex::Table::find(const ChildList& children,
                                    ComponentView value,
                                    std::uint32_t hash) const {
    return positions_.find(hash, [&](std::size_t position) {
        return sameComponent(children[position].value(), value);
    });
}

ChildIndex::Found ChildIndex::find(BNode& parent, ComponentView value) {
    const ChildList children = parent.children();
    const std::size_t count = children.size();
    std::size_t position = notFound;
    if (count <= maxSearched) {
        position = searchFromFront(children, value);
    } else {
        Table& table = tables_[&parent];
        indexedChildren_ += table.indexNewChildren(children);
        position = table.find(children, value, HashIndex::hashOf(value));
    }
    if (position == notFound) return {};
    return {&children[position], position};
}

void ChildIndex::clear() noexcept {
    releaseContents(tables_);
    indexedChildren_ = 0;
}

std::size_t ChildIndex::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const BNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes = tables_.size() * mapNode;
    if (!tables_.empty()) bytes += tables_.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables_) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
