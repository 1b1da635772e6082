#include "pathtree/ChildFinder.hpp"

#include <bit>
#include <functional>
#include <string_view>

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children a search from the front beats a table.
constexpr std::size_t widestSearched = 8;

std::uint64_t hashOf(ComponentView value) noexcept {
    return std::hash<std::string_view>{}(
        {reinterpret_cast<const char*>(value.data()), value.size()});
}

std::uint32_t tagOf(std::uint64_t hash) noexcept {
    return static_cast<std::uint32_t>(hash >> 32);
}

std::size_t searchFromFront(const ChildList& children, ComponentView value) {
    const std::size_t count = children.size();
    for (std::size_t i = 0; i < count; ++i)
        if (sameComponent(children[i].value(), value)) return i;
    return ChildFinder::notFound;
}

}  // namespace

void ChildFinder::Table::insert(const ChildList& children,
                                std::size_t position) {
    const ComponentView value = children[position].value();
    const std::uint64_t hash = hashOf(value);
    const std::size_t mask = entries.size() - 1;
    for (std::size_t at = hash & mask;; at = (at + 1) & mask) {
        Entry& entry = entries[at];
        if (entry.positionPlusOne == 0) {
            entry = {tagOf(hash), static_cast<std::uint32_t>(position + 1)};
            return;
        }
        // An equal child that came earlier is the one to find.
        if (entry.tag == tagOf(hash) &&
            sameComponent(children[entry.positionPlusOne - 1].value(), value))
            return;
    }
}

void ChildFinder::Table::rebuild(const ChildList& children) {
    // At most 5/8 full when new and 3/4 when it grows again.
    entries.assign(std::bit_ceil(children.size() * 8 / 5), Entry{});
    for (std::size_t i = 0; i < children.size(); ++i) insert(children, i);
}

std::size_t ChildFinder::Table::catchUp(const ChildList& children) {
    const std::size_t fresh = children.size() - held;
    if (children.size() > entries.size() / 4 * 3) {
        rebuild(children);
    } else {
        for (std::size_t i = held; i < children.size(); ++i)
            insert(children, i);
    }
    held = children.size();
    return fresh;
}

std::size_t ChildFinder::Table::find(const ChildList& children,
                                     ComponentView value) const {
    const std::uint64_t hash = hashOf(value);
    const std::size_t mask = entries.size() - 1;
    for (std::size_t at = hash & mask;; at = (at + 1) & mask) {
        const Entry& entry = entries[at];
        if (entry.positionPlusOne == 0) return notFound;
        const std::size_t position = entry.positionPlusOne - 1;
        if (entry.tag == tagOf(hash) &&
            sameComponent(children[position].value(), value))
            return position;
    }
}

ChildFinder::LastFound& ChildFinder::lastFoundIn(const BNode& parent) noexcept {
    const auto address = reinterpret_cast<std::uintptr_t>(&parent);
    return lastFound[(address ^ (address >> 9)) / 4 & (lastFoundPlaces - 1)];
}

ChildFinder::Found ChildFinder::find(BNode& parent, ComponentView value) {
    if (lastFound.empty()) lastFound.resize(lastFoundPlaces);
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
        Table& table = tables[&parent];
        indexed += table.catchUp(children);
        position = table.find(children, value);
    }
    if (position == notFound) return {};
    last = {&parent, {&children[position], position}};
    return last.found;
}

void ChildFinder::noteAppended(BNode& parent) noexcept {
    const ChildList children = parent.children();
    if (!lastFound.empty())
        lastFoundIn(parent) = {&parent,
                               {&children.back(), children.size() - 1}};
}

void ChildFinder::clear() noexcept {
    releaseContents(lastFound);
    releaseContents(tables);
    indexed = 0;
}

std::size_t ChildFinder::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const BNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes =
        lastFound.capacity() * sizeof(LastFound) + tables.size() * mapNode;
    if (!tables.empty()) bytes += tables.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
