#pragma once

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <string_view>
#include <vector>

#include "pathtree/BNode.hpp"

namespace tessel {

// Finds things by the hash of their bytes: a table from hash to the position
// of a thing in a list that the caller keeps. Open addressing; an entry
// keeps 32 bits of the hash, so that most misses never touch the thing.
//
// Threads: none.
// Cost: constant time on average; 11 to 22 bytes a thing.
class HashIndex {
public:
    static constexpr std::size_t notFound = ~std::size_t{0};

    // Positions above this cannot be inserted.
    static constexpr std::size_t largestPosition = 0xFFFFFFFE;

    static std::uint32_t hashOf(ComponentView bytes) noexcept {
        return static_cast<std::uint32_t>(std::hash<std::string_view>{}(
            {reinterpret_cast<const char*>(bytes.data()), bytes.size()}));
    }

    // The position inserted under this hash for which isIt(position) holds,
    // or notFound.
    template <class IsIt>
    std::size_t find(std::uint32_t hash, IsIt isIt) const {
        if (entries_.empty()) return notFound;
        const std::size_t mask = entries_.size() - 1;
        for (std::size_t at = hash & mask;; at = (at + 1) & mask) {
            const Entry& entry = entries_[at];
            if (entry.positionPlusOne == 0) return notFound;
            const std::size_t position = entry.positionPlusOne - 1;
            if (entry.hash == hash && isIt(position)) return position;
        }
    }

    // Inserts a position that find does not find. If it throws
    // (std::bad_alloc), nothing changes.
    void insert(std::uint32_t hash, std::size_t position) {
        if (used_ >= entries_.size() / 4 * 3) reserve(used_ + 1);
        place({hash, static_cast<std::uint32_t>(position + 1)});
        ++used_;
    }

    // Makes room for `count` things in all.
    void reserve(std::size_t count) {
        const std::size_t size =
            std::max(smallest, std::bit_ceil(count * 8 / 5 + 1));
        if (size <= entries_.size()) return;
        std::vector<Entry> old(size);
        old.swap(entries_);
        for (const Entry& entry : old)
            if (entry.positionPlusOne != 0) place(entry);
    }

    // The first position that find would look at, unless another hash has
    // its place.
    std::size_t likely(std::uint32_t hash) const noexcept {
        if (entries_.empty()) return notFound;
        const Entry& entry = entries_[hash & (entries_.size() - 1)];
        return entry.positionPlusOne == 0 || entry.hash != hash
                   ? notFound
                   : entry.positionPlusOne - std::size_t{1};
    }

    // Asks the processor for the entry that find will look at first.
    void fetch(std::uint32_t hash) const noexcept {
        if (!entries_.empty())
            __builtin_prefetch(&entries_[hash & (entries_.size() - 1)]);
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return entries_.capacity() * sizeof(Entry);
    }

private:
    static constexpr std::size_t smallest = 16;

    struct Entry {
        std::uint32_t hash = 0;
        std::uint32_t positionPlusOne = 0;  // 0: free
    };

    void place(Entry entry) noexcept {
        const std::size_t mask = entries_.size() - 1;
        std::size_t at = entry.hash & mask;
        while (entries_[at].positionPlusOne != 0) at = (at + 1) & mask;
        entries_[at] = entry;
    }

    std::vector<Entry> entries_;  // a power of two, or nothing yet
    std::size_t used_ = 0;
};

}  // namespace tessel
