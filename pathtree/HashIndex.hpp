#pragma once

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "pathtree/Component.hpp"

namespace tessel {

// Finds things by the hash of their bytes: a table from hash to the position
// of a thing in a list that the caller keeps. Open addressing with linear
// probing.
//
//   entry:  | hash, 32 bits | position + 1, 32 bits; 0: free |
//
// Most misses are decided by the 32 bits and never touch the thing.
//
// Threads: hashOf may be called on any thread; else one thread at a time.
// Cost: constant time on average, for names that were made to collide, too:
//   the hash is keyed with a secret of the process. 11 to 22 bytes per thing.
class HashIndex {
public:
    static constexpr std::size_t notFound = ~std::size_t{0};

    // Positions above this cannot be inserted.
    static constexpr std::size_t maxPosition = 0xFFFFFFFE;

    // The low half of XXH3, keyed with random bits that are drawn once per
    // process: without them nobody can compute names that collide. So the
    // hash of a name differs from run to run; store none.
    static std::uint32_t hashOf(ComponentView bytes) noexcept;

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
        reserveMore(1);
        place({hash, static_cast<std::uint32_t>(position + 1)});
        ++used_;
    }

    // Makes sure that the next `count` insertions do not throw.
    void reserveMore(std::size_t count) {
        if (used_ + count > entries_.size() / 4 * 3) reserve(used_ + count);
    }

    // Makes room for `count` things in all.
    void reserve(std::size_t count) {
        const std::size_t size =
            std::max(minEntries, std::bit_ceil(count * 8 / 5 + 1));
        if (size <= entries_.size()) return;
        std::vector<Entry> old(size);
        old.swap(entries_);
        for (const Entry& entry : old)
            if (entry.positionPlusOne != 0) place(entry);
    }

    // Entries that a search for a thing of this hash looks at if it is not
    // there: 1 in the best case. For tests.
    std::size_t probes(std::uint32_t hash) const noexcept {
        if (entries_.empty()) return 0;
        const std::size_t mask = entries_.size() - 1;
        std::size_t count = 1;
        for (std::size_t at = hash & mask; entries_[at].positionPlusOne != 0;
             at = (at + 1) & mask)
            ++count;
        return count;
    }

    // The position in the slot where a search begins, if its hash is this
    // one; else notFound.
    std::size_t homeSlot(std::uint32_t hash) const noexcept {
        if (entries_.empty()) return notFound;
        const Entry& entry = entries_[hash & (entries_.size() - 1)];
        return entry.positionPlusOne == 0 || entry.hash != hash
                   ? notFound
                   : entry.positionPlusOne - std::size_t{1};
    }

    // Prefetches the entry that find will look at first.
    void prefetch(std::uint32_t hash) const noexcept {
        if (!entries_.empty())
            __builtin_prefetch(&entries_[hash & (entries_.size() - 1)]);
    }

    // Bytes on the heap.
    std::size_t memoryBytes() const noexcept {
        return entries_.capacity() * sizeof(Entry);
    }

private:
    static constexpr std::size_t minEntries = 16;

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
