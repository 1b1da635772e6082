#include "archive/ScatteredReader.hpp"

#include <algorithm>

#include "archive/ArchiveReader.hpp"

namespace tessel::archive {
namespace {

// Places to find at a time where no batch asks for more.
constexpr std::size_t minPlaces = 256;

}  // namespace

ScatteredReader::ScatteredReader(const Segment& segment)
    : segment_(segment),
      order_(segment, Section::Order),
      paths_(segment),
      batch_(segment),
      perBlock_(segment.head().namesPerBlock),
      inPlace_(isInPlace(segment)) {}

// Puts the places of the first `count` numbers into places_.
template <class NumberAt>
void ScatteredReader::findPlaces(std::uint64_t count, NumberAt numberAt) {
    const std::uint64_t first = segment_.entry().firstNumber;
    places_.resize(count);
    for (std::uint64_t i = 0; i < count; ++i) {
        const std::uint64_t number = numberAt(i) - first;
        places_[i] =
            inPlace_ ? static_cast<std::uint32_t>(number) : order_.at(number);
    }
}

// Hints for the paths that come next, if they are in other blocks.
void ScatteredReader::prefetch(std::size_t i) const noexcept {
    const auto step = [&](std::size_t ahead, auto hint) {
        const std::size_t next = std::min(i + ahead, places_.size() - 1);
        if (places_[next] - places_[i] >= 2 * perBlock_)
            hint(places_[next] / perBlock_);
    };
    step(8, [&](std::uint32_t block) { segment_.prefetchNameGroup(block); });
    step(5, [&](std::uint32_t block) { segment_.prefetchNames(block); });
    step(2, [&](std::uint32_t block) { segment_.prefetchFolder(block); });
}

// Shows the paths at places_, which ascend.
template <class NumberAt>
bool ScatteredReader::showAscending(NumberAt numberAt, PathVisitor visitor) {
    const bool isDense = places_.back() - places_.front() < 2 * places_.size();
    for (std::size_t i = 0; i < places_.size(); ++i) {
        if (!isDense) prefetch(i);
        if (!visitor(numberAt(i), paths_.at(places_[i]))) return false;
    }
    return true;
}

template <class NumberAt>
bool ScatteredReader::showBatch(NumberAt numberAt, PathVisitor visitor) {
    for (std::size_t i = 0; i < batch_.size(); ++i)
        if (!visitor(numberAt(i), batch_[i])) return false;
    return true;
}

template <class NumberAt>
bool ScatteredReader::readAll(std::uint64_t count, NumberAt numberAt,
                              PathVisitor visitor) {
    for (std::uint64_t done = 0; done < count;) {
        const auto next = [&](std::uint64_t i) { return numberAt(done + i); };
        findPlaces(std::min<std::uint64_t>(count - done,
                                           std::max(batch_.room(), minPlaces)),
                   next);
        if (std::ranges::is_sorted(places_)) {
            if (!showAscending(next, visitor)) return false;
            done += places_.size();
        } else {
            batch_.fill(places_);
            if (!showBatch(next, visitor)) return false;
            done += batch_.size();
        }
    }
    return true;
}

bool ScatteredReader::read(std::span<const std::uint64_t> numbers,
                           PathVisitor visitor) {
    return readAll(
        numbers.size(), [numbers](std::uint64_t i) { return numbers[i]; },
        visitor);
}

bool ScatteredReader::read(std::uint64_t first, std::uint64_t last,
                           PathVisitor visitor) {
    return readAll(
        last - first, [first](std::uint64_t i) { return first + i; }, visitor);
}

}  // namespace tessel::archive
