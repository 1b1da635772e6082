#pragma once

#include <cstddef>
#include <cstdint>
#include <unordered_map>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// Finds the first child with a given value, as a search from the front
// would, without looking at every child of a wide folder.
//
// Two memories serve it: a cache of children found or appended before, which
// lists of paths ask for again and again, and for each wide folder a hash
// table from value to first position, which also knows what is not there.
// Children are only appended and never change, so neither can become wrong;
// a table takes in the children that came since its last use, whoever
// appended them. The finder must be cleared before nodes that it has seen
// are released.
//
// Threads: none; one thread at a time.
// Cost: a search takes constant time on average. The cache takes about 50
//   bytes a folder, 6 MiB at most; the tables take 11 to 22 bytes a child of
//   the wide folders that were searched.
class ChildFinder {
public:
    static constexpr std::size_t notFound = ~std::size_t{0};

    struct Found {
        BNode* child = nullptr;
        std::size_t position = notFound;
    };

    // The first child of parent that equals value.
    Found find(BNode& parent, ComponentView value);

    // Notes the last child of parent, which was appended because find did
    // not find its value.
    void noteAppended(BNode& parent);

    // Children that the memories hold.
    std::size_t heldChildren() const noexcept { return indexed + noted; }

    // Forgets everything and releases the memory.
    void clear() noexcept;

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

private:
    // Open addressing over positions. An entry keeps half of the hash, so
    // that most misses never touch a node.
    class Table {
    public:
        // Takes in the children that it does not hold yet; returns how many.
        std::size_t catchUp(const ChildList& children);
        std::size_t find(const ChildList& children, ComponentView value,
                         std::uint64_t hash) const;
        std::size_t memoryBytes() const noexcept {
            return entries.capacity() * sizeof(Entry);
        }

    private:
        struct Entry {
            std::uint32_t tag = 0;
            std::uint32_t positionPlusOne = 0;  // 0: free
        };
        void rebuild(const ChildList& children);
        void insert(const ChildList& children, std::size_t position);

        std::vector<Entry> entries;  // a power of two
        std::size_t held = 0;        // children 0 to held - 1 are in
    };

    // A child that find once answered. An entry gives way to another one
    // that wants its place.
    struct Cached {
        const BNode* parent = nullptr;
        BNode* child = nullptr;
        std::uint32_t position = 0;
        std::uint32_t tag = 0;  // half of the hash of the child's value
    };

    Cached& placeFor(const BNode& parent, std::uint32_t tag) noexcept;
    void growCache();

    std::vector<Cached> cache;  // a power of two, or nothing yet
    std::unordered_map<const BNode*, Table> tables;
    std::size_t indexed = 0;  // children in the tables
    std::size_t noted = 0;    // children appended since the cache was empty
};

}  // namespace tessel
