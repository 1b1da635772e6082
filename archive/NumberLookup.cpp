#include "archive/NumberLookup.hpp"

#include <algorithm>
#include <string>

#include "archive/GivenOrderSearch.hpp"
#include "archive/IndexedSearch.hpp"
#include "archive/PackedNumbers.hpp"
#include "archive/SortedSearch.hpp"

namespace tessel::archive {
namespace {

bool hasIndex(const Segment& segment) noexcept {
    return segment.bytesOf(Section::Index) > 0;
}

// Calls visit with each number whose place is within the range, in ascending
// order, until it returns false.
template <class Visit>
void scanOrder(const Segment& segment, NumberRange places, Visit visit) {
    const PackedNumbers order(segment, Section::Order);
    for (std::uint64_t number = 0; number < segment.size(); ++number)
        if (order.at(number) - places.begin < places.end - places.begin &&
            !visit(number))
            return;
}

// ---- One segment; numbers count from its first ----

std::uint64_t placeOfFirst(const Segment& segment, std::string_view path) {
    if (segment.head().order != ListOrder::AsGiven)
        return SortedSearch(segment).find(path);
    if (hasIndex(segment)) return IndexedSearch(segment).find(path);
    return GivenOrderSearch(segment).find(path);
}

std::uint64_t numberAt(const Segment& segment, std::uint64_t place) {
    if (isInPlace(segment)) return place;
    if (hasIndex(segment))
        return PackedNumbers(segment, Section::Index).at(place);
    std::uint64_t found = 0;
    scanOrder(segment, {place, place + 1}, [&](std::uint64_t number) {
        found = number;
        return false;
    });
    return found;
}

// A scan of the whole order costs as much as sorting a part of it.
constexpr std::uint64_t worthSorting = 16;

void appendNumbers(const Segment& segment, NumberRange places,
                   std::vector<NumberRange>& out) {
    const std::uint64_t first = segment.entry().firstNumber;
    const auto append = [&](NumberRange numbers) {
        appendRange(out, {first + numbers.begin, first + numbers.end});
    };
    if (places.begin >= places.end) return;
    if (isInPlace(segment)) return append(places);
    if (hasIndex(segment) &&
        (places.end - places.begin) * worthSorting < segment.size()) {
        const PackedNumbers index(segment, Section::Index);
        std::ranges::for_each(sortedNumbers(index, places), append);
        return;
    }
    scanOrder(segment, places, [&](std::uint64_t number) {
        append({number, number + 1});
        return true;
    });
}

}  // namespace

std::optional<std::uint64_t> numberOf(const ArchiveReader& archive,
                                      std::string_view path) {
    for (std::size_t i = 0; i < archive.segmentCount(); ++i) {
        const Segment& segment = archive.segment(i);
        const std::uint64_t place = placeOfFirst(segment, path);
        if (place < segment.size())
            return segment.entry().firstNumber + numberAt(segment, place);
    }
    return std::nullopt;
}

bool contains(const ArchiveReader& archive, std::string_view path) {
    for (std::size_t i = 0; i < archive.segmentCount(); ++i)
        if (placeOfFirst(archive.segment(i), path) < archive.segment(i).size())
            return true;
    return false;
}

std::string prefixOf(std::string_view folder) {
    std::string prefix(folder);
    if (!prefix.empty() && prefix.back() != '/') prefix += '/';
    return prefix;
}

std::vector<NumberRange> placesBelow(const Segment& segment,
                                     std::string_view prefix) {
    if (prefix.empty()) return {{0, segment.size()}};
    if (segment.head().order == ListOrder::AsGiven)
        return hasIndex(segment)
                   ? IndexedSearch(segment).startingWith(prefix)
                   : GivenOrderSearch(segment).startingWith(prefix);
    SortedSearch search(segment);
    std::string after(prefix);
    ++after.back();  // the least string above all that start with the prefix
    return {{search.lowerBound(prefix), search.lowerBound(after)}};
}

std::vector<NumberRange> numbersBelow(const ArchiveReader& archive,
                                      std::string_view folder) {
    const std::string prefix = prefixOf(folder);
    std::vector<NumberRange> found;
    for (std::size_t i = 0; i < archive.segmentCount(); ++i)
        for (const NumberRange places : placesBelow(archive.segment(i), prefix))
            appendNumbers(archive.segment(i), places, found);
    return found;
}

}  // namespace tessel::archive
