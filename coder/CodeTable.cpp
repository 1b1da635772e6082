#include "coder/CodeTable.hpp"

#include <algorithm>
#include <stdexcept>

namespace tessel {

void CodeTable::insert(char16_t character, const Entry& entry) {
    if (!entry.isLong &&
        (entry.length > longestInline || entry.bits >> entry.length != 0))
        throw std::invalid_argument("A code is not as long as it says.");
    std::uint32_t& start = pageStart_[character >> 8];
    if (start == 0) {
        const auto fresh = static_cast<std::uint32_t>(entries_.size());
        entries_.reserve(entries_.size() + pageEntries);
        entries_.resize(entries_.size() + pageEntries);
        start = fresh;
    }
    Entry& place = entries_[start + (character & 0xFFU)];
    if (place.exists()) return;
    place = entry;
    ++count_;
}

void CodeTable::clear() noexcept {
    std::fill(pageStart_.begin(), pageStart_.end(), 0U);
    entries_.resize(pageEntries);
    count_ = 0;
}

}  // namespace tessel
