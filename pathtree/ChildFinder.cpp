#include "pathtree/ChildFinder.hpp"

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children a search from the front beats a table.
constexpr std::size_t widestSearched = 8;

std::size_t searchFromFront(const ChildList& children, ComponentView value) {
    const std::size_t count = children.size();
    for (std::size_t i = 0; i < count; ++i)
        if (sameComponent(children[i].value(), value)) return i;
    return ChildFinder::notFound;
}

}  // namespace

std::size_t ChildFinder::Table::catchUp(const ChildList& children) {
    const std::size_t fresh = children.size() - held_;
    if (fresh > 1) positions_.reserve(children.size());
    for (; held_ < children.size(); ++held_) {
        const ComponentView value = children[held_].value();
        const std::uint32_t hash = HashIndex::hashOf(value);
        // An equal child that came earlier is the one to find.
        if (find(children, value, hash) == notFound)
            positions_.insert(hash, held_);
    }
    return fresh;
}

std::size_t ChildFinder::Table::find(const ChildList& children,
                                     ComponentView value,
                                     std::uint32_t hash) const {
    return positions_.find(hash, [&](std::size_t position) {
        return sameComponent(children[position].value(), value);
    });
}

ChildFinder::LastFound& ChildFinder::lastFoundIn(const BNode& parent) noexcept {
    const auto address = reinterpret_cast<std::uintptr_t>(&parent);
    return lastFound_[(address ^ (address >> 9)) / 4 & (lastFoundPlaces - 1)];
}

ChildFinder::Found ChildFinder::find(BNode& parent, ComponentView value) {
    if (lastFound_.empty()) lastFound_.resize(lastFoundPlaces);
    LastFound& last = lastFoundIn(parent);
    if (last.parent == &parent &&
        sameComponent(last.found.child->value(), value))
        return last.found;
    const ChildList children = parent.children();
    const std::size_t count = children.size();
    if (count == 0) return {};
    std::size_t position = notFound;
    if (count <= widestSearched) {
        position = searchFromFront(children, value);
    } else {
        Table& table = tables_[&parent];
        indexed_ += table.catchUp(children);
        position = table.find(children, value, HashIndex::hashOf(value));
    }
    if (position == notFound) return {};
    last = {&parent, {&children[position], position}};
    return last.found;
}

void ChildFinder::noteAppended(BNode& parent) noexcept {
    const ChildList children = parent.children();
    if (!lastFound_.empty())
        lastFoundIn(parent) = {&parent,
                               {&children.back(), children.size() - 1}};
}

void ChildFinder::clear() noexcept {
    releaseContents(lastFound_);
    releaseContents(tables_);
    indexed_ = 0;
}

std::size_t ChildFinder::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const BNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes =
        lastFound_.capacity() * sizeof(LastFound) + tables_.size() * mapNode;
    if (!tables_.empty()) bytes += tables_.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables_) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
