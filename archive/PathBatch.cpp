#include "archive/PathBatch.hpp"

#include <algorithm>
#include <array>

#include "archive/ArchiveExceptions.hpp"

namespace tessel::archive {
namespace {

constexpr unsigned indexBits = 32;
// Two digits hold any place, which is below 2^23.
constexpr unsigned digitBits = 12;
constexpr std::size_t digits = std::size_t{1} << digitBits;

std::uint32_t placeOf(std::uint64_t entry) noexcept {
    return static_cast<std::uint32_t>(entry >> indexBits);
}

std::uint32_t indexOf(std::uint64_t entry) noexcept {
    return static_cast<std::uint32_t>(entry);
}

}  // namespace

// ---- Order ----

// One pass of a radix sort, which keeps the order of equal digits.
void PathBatch::sortByDigits(unsigned shift) {
    const auto digitOf = [shift](std::uint64_t entry) {
        return (entry >> shift) % digits;
    };
    std::array<std::uint32_t, digits> next{};
    for (const std::uint64_t entry : order_) ++next[digitOf(entry)];
    std::uint32_t start = 0;
    for (std::uint32_t& count : next) {
        const std::uint32_t size = count;
        count = start;
        start += size;
    }
    sorting_.resize(order_.size());
    for (const std::uint64_t entry : order_)
        sorting_[next[digitOf(entry)]++] = entry;
    order_.swap(sorting_);
}

void PathBatch::sortByPlace(std::span<const std::uint32_t> places) {
    order_.resize(places.size());
    for (std::size_t i = 0; i < places.size(); ++i)
        order_[i] = std::uint64_t{places[i]} << indexBits | i;
    // The passes clear and add up all digits, whatever the size.
    if (order_.size() < digits) {
        std::ranges::sort(order_);
    } else {
        sortByDigits(indexBits);
        sortByDigits(indexBits + digitBits);
    }
}

// ---- Decoding ----

// Hints for what will be decoded a few paths from now. Decoding one path takes
// as long as one access to the memory.
void PathBatch::prefetch(std::size_t next) const noexcept {
    const auto blockOf = [&](std::size_t ahead) {
        const std::size_t i = std::min(next + ahead, order_.size() - 1);
        return placeOf(order_[i]) / segment_->head().namesPerBlock;
    };
    segment_->prefetchNameGroup(blockOf(8));
    segment_->prefetchNames(blockOf(5));
    segment_->prefetchFolder(blockOf(2));
}

// False if the text would be too long.
bool PathBatch::decode(std::span<const std::uint32_t> places) {
    sortByPlace(places);
    texts_.resize(places.size());
    text_.clear();
    PathCursor paths(*segment_);
    for (std::size_t i = 0; i < order_.size(); ++i) {
        prefetch(i);
        const std::string_view path = paths.at(placeOf(order_[i]));
        if (path.size() > maxTextBytes - text_.size()) return false;
        texts_[indexOf(order_[i])] = {static_cast<std::uint32_t>(text_.size()),
                                      static_cast<std::uint32_t>(path.size())};
        text_ += path;
    }
    return true;
}

// If the texts of a batch are too long together, half as many paths are tried.
// If one of them is damaged, only the first is tried, so that all paths before
// the damage are still shown. Later batches are not larger, since the cause is
// likely to come again.
void PathBatch::fill(std::span<const std::uint32_t> places) {
    room_ = std::min(room_, places.size());
    for (;;) {
        try {
            if (decode(places.first(room_))) break;
            limit_ = room_ /= 2;
        } catch (const DamagedArchiveException&) {
            if (room_ == 1) throw;
            limit_ = room_ = 1;
        }
    }
    room_ = std::min(4 * room_, limit_);
}

}  // namespace tessel::archive
