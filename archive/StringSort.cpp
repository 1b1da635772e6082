#include "archive/StringSort.hpp"

#include <algorithm>
#include <array>
#include <utility>
#include <vector>

namespace tessel::archive {

namespace {

// Strings from here on are compared from byte `depth`; all bytes before it
// are equal.
struct Bucket {
    std::span<StringItem> items;
    std::size_t depth;
};

// Below this many strings, comparing is cheaper than loading keys. Of little
// influence between 8 and 32.
constexpr std::size_t fewItems = 16;

// The eight bytes from `depth` on as a number that compares as they do. No
// string holds a zero byte, so the end of a string compares lowest.
std::uint64_t keyAt(std::string_view text, std::size_t depth) {
    std::uint64_t key = 0;
    const std::size_t end = std::min(text.size(), depth + 8);
    for (std::size_t i = depth; i < end; ++i)
        key |= std::uint64_t{static_cast<std::uint8_t>(text[i])}
               << (56 - 8 * (i - depth));
    return key;
}

void sortFew(const Bucket& bucket) {
    std::ranges::sort(bucket.items, [&](const StringItem& a,
                                        const StringItem& b) {
        const int order =
            a.text.substr(bucket.depth).compare(b.text.substr(bucket.depth));
        return order != 0 ? order < 0 : a.number < b.number;
    });
}

std::uint64_t medianKey(std::span<const StringItem> items) {
    const std::array<std::uint64_t, 3> keys = {
        items.front().key, items[items.size() / 2].key, items.back().key};
    return std::max(std::min(keys[0], keys[1]),
                    std::min(std::max(keys[0], keys[1]), keys[2]));
}

// Splits by the pivot's key and appends what is left to be sorted.
void partition(const Bucket& bucket, std::vector<Bucket>& left) {
    const std::uint64_t pivot = medianKey(bucket.items);
    const auto lowerEnd = std::partition(
        bucket.items.begin(), bucket.items.end(),
        [&](const StringItem& item) { return item.key < pivot; });
    const auto equalEnd = std::partition(
        lowerEnd, bucket.items.end(),
        [&](const StringItem& item) { return item.key == pivot; });
    left.push_back({{bucket.items.begin(), lowerEnd}, bucket.depth});
    left.push_back({{equalEnd, bucket.items.end()}, bucket.depth});
    const std::span<StringItem> equal(lowerEnd, equalEnd);
    if ((pivot & 0xFFU) == 0) {
        // The strings end here: they are equal.
        std::ranges::sort(equal, {}, &StringItem::number);
        return;
    }
    for (StringItem& item : equal)
        item.key = keyAt(item.text, bucket.depth + 8);
    left.push_back({equal, bucket.depth + 8});
}

}  // namespace

void sortStrings(std::span<StringItem> items) {
    for (StringItem& item : items) item.key = keyAt(item.text, 0);
    std::vector<Bucket> left = {{items, 0}};
    while (!left.empty()) {
        const Bucket bucket = left.back();
        left.pop_back();
        if (bucket.items.size() <= fewItems)
            sortFew(bucket);
        else
            partition(bucket, left);
    }
}

}  // namespace tessel::archive
