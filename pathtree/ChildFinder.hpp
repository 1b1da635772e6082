#pragma once

#include <cstddef>
#include <cstdint>
#include <unordered_map>
#include <vector>

#include "pathtree/BNode.hpp"
#include "pathtree/HashIndex.hpp"

namespace tessel {

// Finds the first child with a given value, as a search from the front
// would, without looking at every child of a wide folder.
//
// Two memories serve it: the children found last, which a sorted list of
// paths asks for again and again, and for each wide folder a hash table from
// value to first position. Children are only appended and never change, so
// neither can become wrong; a table takes in the children that came since
// its last use, whoever appended them. The finder must be cleared before
// nodes that it has seen are released.
//
// Threads: none; one thread at a time.
// Cost: a search takes constant time on average; the tables take 11 to 22
//   bytes a child of the wide folders that were searched.
class ChildFinder {
public:
    static constexpr std::size_t notFound = HashIndex::notFound;

    struct Found {
        BNode* child = nullptr;
        std::size_t position = notFound;
    };

    // The first child of parent that equals value.
    Found find(BNode& parent, ComponentView value);

    // Notes the last child of parent, which was appended because find did
    // not find its value.
    void noteAppended(BNode& parent) noexcept;

    // Children in all tables.
    std::size_t indexedChildren() const noexcept { return indexed_; }

    // Forgets everything and releases the memory.
    void clear() noexcept;

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

private:
    // The first positions of the values among the children of one folder.
    class Table {
    public:
        // Takes in the children that it does not hold yet; returns how many.
        std::size_t catchUp(const ChildList& children);
        std::size_t find(const ChildList& children, ComponentView value,
                         std::uint32_t hash) const;
        std::size_t memoryBytes() const noexcept {
            return positions_.memoryBytes();
        }

    private:
        HashIndex positions_;
        std::size_t held_ = 0;  // children 0 to held - 1 are in
    };

    struct LastFound {
        const BNode* parent = nullptr;
        Found found;
    };
    static constexpr std::size_t lastFoundPlaces = 64;  // a power of two

    LastFound& lastFoundIn(const BNode& parent) noexcept;

    std::vector<LastFound> lastFound_;
    std::unordered_map<const BNode*, Table> tables_;
    std::size_t indexed_ = 0;
};

}  // namespace tessel
