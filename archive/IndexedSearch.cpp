#include "archive/IndexedSearch.hpp"

#include <string>

namespace tessel::archive {

IndexedSearch::IndexedSearch(const Segment& segment)
    : segment_(segment), index_(segment, Section::Index), paths_(segment) {}

// The first place in the index whose path is not less than this one.
std::uint64_t IndexedSearch::lowerBound(std::string_view path) {
    std::uint64_t first = 0;
    std::uint64_t last = segment_.size();
    while (first < last) {
        const std::uint64_t middle = first + (last - first) / 2;
        if (paths_.at(index_.at(middle)) < path)
            first = middle + 1;
        else
            last = middle;
    }
    return first;
}

std::uint64_t IndexedSearch::find(std::string_view path) {
    const std::uint64_t found = lowerBound(path);
    if (found == segment_.size()) return found;
    const std::uint64_t place = index_.at(found);
    return paths_.at(place) == path ? place : segment_.size();
}

std::vector<NumberRange> IndexedSearch::startingWith(std::string_view prefix) {
    if (prefix.empty()) return {{0, segment_.size()}};
    std::string after(prefix);
    ++after.back();  // the least string above all that start with the prefix
    return sortedNumbers(index_, {lowerBound(prefix), lowerBound(after)});
}

}  // namespace tessel::archive
