#include "archive/ScatteredReader.hpp"

#include <algorithm>

namespace tessel::archive {

ScatteredReader::ScatteredReader(const Segment& segment)
    : segment_(segment),
      order_(segment, Section::Order),
      paths_(segment),
      perBlock_(segment.head().namesPerBlock),
      inPlace_(segment.head().order != ListOrder::Rearranged),
      lastPlace_(segment.size()) {}

// Finds the place of the path that comes `lookahead` paths from now.
void ScatteredReader::announce(std::uint64_t index, std::uint64_t number) {
    const std::uint64_t inSegment = number - segment_.entry().firstNumber;
    const std::uint64_t place = inPlace_ ? inSegment : order_.at(inSegment);
    const bool isFar = place - lastPlace_ >= 2 * std::uint64_t{perBlock_};
    if (isFar) segment_.prefetchNameGroup(blockOf(place));
    coming(index) = {place, isFar};
    lastPlace_ = place;
}

// Two further steps, for paths that are nearer.
void ScatteredReader::prefetch(std::uint64_t index, std::uint64_t count) {
    const auto step = [&](std::uint64_t ahead, auto hint) {
        if (index + ahead >= count) return;
        const Coming& path = coming(index + ahead);
        if (path.isFar) hint(blockOf(path.place));
    };
    step(5, [&](std::uint32_t block) { segment_.prefetchNames(block); });
    step(2, [&](std::uint32_t block) { segment_.prefetchFolder(block); });
}

template <class NumberAt>
bool ScatteredReader::readAll(std::uint64_t count, NumberAt numberAt,
                              PathVisitor visitor) {
    for (std::uint64_t i = 0; i < std::min<std::uint64_t>(count, lookahead);
         ++i)
        announce(i, numberAt(i));
    for (std::uint64_t i = 0; i < count; ++i) {
        prefetch(i, count);
        const std::uint64_t place = coming(i).place;
        if (i + lookahead < count)
            announce(i + lookahead, numberAt(i + lookahead));
        if (!visitor(numberAt(i), paths_.at(place))) return false;
    }
    return true;
}

bool ScatteredReader::read(std::span<const std::uint64_t> numbers,
                           PathVisitor visitor) {
    const std::uint64_t first = segment_.entry().firstNumber;
    const auto numberAt = [&](std::uint64_t i) {
        // The order's bits of a number further on.
        if (!inPlace_ && i + lookahead < numbers.size())
            order_.prefetch(numbers[i + lookahead] - first);
        return numbers[i];
    };
    return readAll(numbers.size(), numberAt, visitor);
}

bool ScatteredReader::read(std::uint64_t first, std::uint64_t last,
                           PathVisitor visitor) {
    return readAll(
        last - first, [first](std::uint64_t i) { return first + i; }, visitor);
}

}  // namespace tessel::archive
