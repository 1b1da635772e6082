#include "archive/FolderTable.hpp"

#define XXH_INLINE_ALL
#include <xxhash.h>

#include <algorithm>

namespace tessel::archive {

std::uint32_t FolderTable::numberOf(std::string_view folder) {
    if (slots_.size() < 2 * size() + 2) growSlots();
    const auto hash =
        static_cast<std::uint32_t>(XXH3_64bits(folder.data(), folder.size()));
    const std::size_t mask = slots_.size() - 1;
    std::size_t slot = hash & mask;
    for (; slots_[slot] != 0; slot = (slot + 1) & mask) {
        const std::uint32_t number = slots_[slot] - 1;
        if (hashes_[number] == hash && (*this)[number] == folder) return number;
    }
    // What an addition that lacked memory left behind.
    text_.resize(starts_.back());
    hashes_.resize(size());
    text_.insert(text_.end(), folder.begin(), folder.end());
    text_.push_back('\0');
    hashes_.push_back(hash);
    starts_.push_back(static_cast<std::uint32_t>(text_.size()));
    slots_[slot] = static_cast<std::uint32_t>(size());
    return static_cast<std::uint32_t>(size() - 1);
}

void FolderTable::growSlots() {
    slots_.assign(std::max<std::size_t>(64, 4 * slots_.size()), 0);
    const std::size_t mask = slots_.size() - 1;
    for (std::uint32_t number = 0; number < size(); ++number) {
        std::size_t slot = hashes_[number] & mask;
        while (slots_[slot] != 0) slot = (slot + 1) & mask;
        slots_[slot] = number + 1;
    }
}

void FolderTable::clear() {
    text_.clear();
    starts_.assign(1, 0);
    hashes_.clear();
    std::ranges::fill(slots_, 0U);
}

}  // namespace tessel::archive
