#include "pathtree/ChildIndex.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children are searched from the front: their slots are one
// cache line, and a value of another length is told apart by one byte. Too
// large costs a look at each child, too small a table for little folders.
constexpr std::size_t maxSearched = 8;

// A power of two. An entry takes 24 bytes: the cache stays in 1.5 KiB, which
// the processor's first cache keeps. A deep path needs one slot per level.
constexpr std::size_t cacheEntries = 64;

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

ChildIndex::CacheEntry& ChildIndex::cacheEntryOf(const BNode& parent) noexcept {
    const auto address = reinterpret_cast<std::uintptr_t>(&parent);
    return cache_[(address ^ (address >> 9)) / 4 & (cacheEntries - 1)];
}

ChildIndex::Found ChildIndex::find(BNode& parent, ComponentView value) {
    if (cache_.empty()) cache_.resize(cacheEntries);
    CacheEntry& last = cacheEntryOf(parent);
    if (last.parent == &parent &&
        sameComponent(last.found.child->value(), value))
        return last.found;
    const ChildList children = parent.children();
    const std::size_t count = children.size();
    if (count == 0) return {};
    std::size_t position = notFound;
    if (count <= maxSearched) {
        position = searchFromFront(children, value);
    } else {
        Table& table = tables_[&parent];
        indexedChildren_ += table.indexNewChildren(children);
        position = table.find(children, value, HashIndex::hashOf(value));
    }
    if (position == notFound) return {};
    last = {&parent, {&children[position], position}};
    return last.found;
}

void ChildIndex::noteAppended(BNode& parent) noexcept {
    const ChildList children = parent.children();
    if (!cache_.empty())
        cacheEntryOf(parent) = {&parent,
                                {&children.back(), children.size() - 1}};
}

void ChildIndex::clear() noexcept {
    releaseContents(cache_);
    releaseContents(tables_);
    indexedChildren_ = 0;
}

std::size_t ChildIndex::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const BNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes =
        cache_.capacity() * sizeof(CacheEntry) + tables_.size() * mapNode;
    if (!tables_.empty()) bytes += tables_.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables_) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
