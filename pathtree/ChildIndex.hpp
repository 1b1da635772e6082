#pragma once

#include <cstddef>
#include <cstdint>
#include <unordered_map>

#include "pathtree/FolderNode.hpp"
#include "pathtree/HashIndex.hpp"

namespace tessel {

// Finds the first child with a given value, as a search from the front
// would, without looking at every child of a wide folder.
//
//   up to 8 children | a search from the front
//   more             | a hash table from value to first position, one per
//                    | folder, made when the folder is first searched
//
// Children are only appended and keep their names, so a table cannot become
// wrong; it takes in the children that came since its last use, whoever
// appended them. Clear the index before nodes that it has seen are released.
//
// Ownership: borrows the nodes.
// Threads: none; one thread at a time.
// Cost: a search takes constant time on average. A table takes 11 to 26
//   bytes per child.
class ChildIndex {
public:
    static constexpr std::size_t notFound = HashIndex::notFound;

    // The position of the first child of parent that equals value, or
    // notFound.
    std::size_t find(FolderNode& parent, ComponentView value);

    // Children in all tables.
    std::size_t indexedChildren() const noexcept { return indexedChildren_; }

    // Forgets everything and releases the memory.
    void clear() noexcept;

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept;

private:
    // The first positions of the values among the children of one folder.
    class Table {
    public:
        // Takes in the children that it does not hold yet; returns how many.
        std::size_t indexNewChildren(const FolderNode& parent);
        std::size_t find(const FolderNode& parent, ComponentView value,
                         std::uint32_t hash) const;
        std::size_t memoryBytes() const noexcept {
            return positions_.memoryBytes();
        }

    private:
        HashIndex positions_;
        std::size_t size_ = 0;  // children [0, size_) are in
    };

    std::unordered_map<const FolderNode*, Table> tables_;
    std::size_t indexedChildren_ = 0;
};

}  // namespace tessel
