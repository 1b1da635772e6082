#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace tessel::archive {

// Two neighbouring tokens: the left one in the upper half.
using TokenPair = std::uint32_t;

constexpr TokenPair pairOf(std::uint16_t left, std::uint16_t right) noexcept {
    return TokenPair{left} << 16U | right;
}

// Counts pairs roughly, in little memory: a count-min sketch (Cormode and
// Muthukrishnan 2005) of one row. A count is never too low, except that it
// stays at 65,535.
class PairSketch {
public:
    explicit PairSketch(unsigned bits)
        : shift_(64 - bits), counts_(std::size_t{1} << bits) {}

    void clear() { std::ranges::fill(counts_, std::uint16_t{0}); }

    void add(TokenPair pair) {
        std::uint16_t& count = counts_[slotOf(pair)];
        if (count != UINT16_MAX) ++count;
    }

    std::uint16_t operator[](TokenPair pair) const {
        return counts_[slotOf(pair)];
    }

    std::uint16_t max() const { return *std::ranges::max_element(counts_); }

    // Counts of at least `threshold`.
    std::size_t atLeast(std::uint16_t threshold) const {
        return static_cast<std::size_t>(std::ranges::count_if(
            counts_, [=](std::uint16_t count) { return count >= threshold; }));
    }

    PairSketch& operator+=(const PairSketch& other) {
        for (std::size_t i = 0; i < counts_.size(); ++i)
            counts_[i] = static_cast<std::uint16_t>(
                std::min(counts_[i] + other.counts_[i], int{UINT16_MAX}));
        return *this;
    }

private:
    std::size_t slotOf(TokenPair pair) const {
        return static_cast<std::size_t>(pair * 0x9E3779B97F4A7C15 >> shift_);
    }

    unsigned shift_;
    std::vector<std::uint16_t> counts_;
};

// Counts pairs exactly, and keeps the token that a pair becomes. Open
// addressing with linear probing; at most half of it is used.
class PairTable {
public:
    struct Entry {
        TokenPair pair = noPair;
        std::uint32_t count = 0;
        std::uint32_t token = 0;  // 0: none. Token 0 is no pair.
    };
    // Both halves are the separator, which is part of no pair.
    static constexpr TokenPair noPair = 0xFFFFFFFF;

    // Removes all entries and makes room for this many pairs. If more come, the
    // table grows: they may, because a number of pairs that was estimated from
    // a sketch is too small where pairs share a count.
    void reset(std::size_t expectedPairs) {
        std::size_t size = 1024;
        while (size < 3 * expectedPairs) size *= 2;
        entries_.assign(size, {});
        used_ = 0;
    }

    // The entry of the pair, or the empty one where it belongs.
    const Entry& find(TokenPair pair) const { return entries_[slotOf(pair)]; }

    void add(TokenPair pair, std::uint32_t count) {
        Entry& entry = entries_[slotOf(pair)];
        if (entry.pair == noPair) {
            addNew({pair, count, 0});
            return;
        }
        entry.count += count;
    }

    // Valid until a pair is added.
    std::vector<Entry>& entries() noexcept { return entries_; }

private:
    void addNew(const Entry& entry) {
        if (2 * ++used_ > entries_.size()) grow();
        entries_[slotOf(entry.pair)] = entry;
    }

    void grow() {
        const std::vector<Entry> old =
            std::exchange(entries_, std::vector<Entry>(2 * entries_.size()));
        for (const Entry& entry : old)
            if (entry.pair != noPair) entries_[slotOf(entry.pair)] = entry;
    }

    std::size_t slotOf(TokenPair pair) const {
        const std::size_t mask = entries_.size() - 1;
        std::size_t slot = pair * 0x9E3779B97F4A7C15 >> 30U & mask;
        while (entries_[slot].pair != pair && entries_[slot].pair != noPair)
            slot = (slot + 1) & mask;
        return slot;
    }

    std::vector<Entry> entries_;
    std::size_t used_ = 0;
};

}  // namespace tessel::archive
