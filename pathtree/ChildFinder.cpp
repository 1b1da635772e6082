#include "pathtree/ChildFinder.hpp"

#include <algorithm>
#include <bit>
#include <functional>
#include <string_view>
#include <utility>

#include "pathtree/containers.hpp"

namespace tessel {

namespace {

// Up to this many children a search from the front beats a table.
constexpr std::size_t widestSearched = 8;

// Entries of the cache, powers of two.
constexpr std::size_t smallestCache = 64;
constexpr std::size_t largestCache = std::size_t{1} << 18;

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
                                     ComponentView value,
                                     std::uint64_t hash) const {
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

ChildFinder::Cached& ChildFinder::placeFor(const BNode& parent,
                                           std::uint32_t tag) noexcept {
    // Multiplicative hashing: the upper half of the product is well mixed.
    const auto address = reinterpret_cast<std::uintptr_t>(&parent);
    const std::uint64_t mixed = (address ^ tag) * 0x9E3779B97F4A7C15U;
    return cache[(mixed >> 32) & (cache.size() - 1)];
}

void ChildFinder::growCache() {
    const std::vector<Cached> old = std::exchange(
        cache, std::vector<Cached>(std::max(smallestCache, 2 * cache.size())));
    for (const Cached& entry : old)
        if (entry.parent != nullptr) placeFor(*entry.parent, entry.tag) = entry;
}

ChildFinder::Found ChildFinder::find(BNode& parent, ComponentView value) {
    if (cache.empty()) growCache();
    const std::uint64_t hash = hashOf(value);
    Cached& place = placeFor(parent, tagOf(hash));
    if (place.parent == &parent && place.tag == tagOf(hash) &&
        sameComponent(place.child->value(), value))
        return {place.child, place.position};
    const ChildList children = parent.children();
    const std::size_t count = children.size();
    if (count == 0) return {};
    std::size_t position = notFound;
    if (count <= widestSearched) {
        position = searchFromFront(children, value);
    } else {
        Table& table = tables[&parent];
        indexed += table.catchUp(children);
        position = table.find(children, value, hash);
    }
    if (position == notFound) return {};
    BNode& child = children[position];
    place = {&parent, &child, static_cast<std::uint32_t>(position),
             tagOf(hash)};
    return {&child, position};
}

void ChildFinder::noteAppended(BNode& parent) {
    if (++noted > cache.size() / 2 && cache.size() < largestCache) growCache();
    const ChildList children = parent.children();
    BNode& child = children.back();
    const std::uint32_t tag = tagOf(hashOf(child.value()));
    placeFor(parent, tag) = {
        &parent, &child, static_cast<std::uint32_t>(children.size() - 1), tag};
}

void ChildFinder::clear() noexcept {
    releaseContents(cache);
    releaseContents(tables);
    indexed = 0;
    noted = 0;
}

std::size_t ChildFinder::memoryBytes() const noexcept {
    constexpr std::size_t mapNode =
        sizeof(std::pair<const BNode* const, Table>) + 2 * sizeof(void*);
    std::size_t bytes =
        cache.capacity() * sizeof(Cached) + tables.size() * mapNode;
    if (!tables.empty()) bytes += tables.bucket_count() * sizeof(void*);
    for (const auto& [parent, table] : tables) bytes += table.memoryBytes();
    return bytes;
}

}  // namespace tessel
