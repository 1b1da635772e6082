#include "archive/ArchiveReader.hpp"

#include <algorithm>
#include <utility>

#include "archive/PathCursor.hpp"
#include "archive/ScatteredReader.hpp"
#include "archive/SegmentDirectory.hpp"

namespace tessel::archive {
// ---- Opening ----

ArchiveReader::ArchiveReader(ArchiveBytes bytes) : bytes_(std::move(bytes)) {
    const auto directory = SegmentDirectory::unpack(bytes_.bytes());
    version_ = directory.version();
    size_ = directory.paths();
    segments_.reserve(directory.entries().size());
    for (const SegmentEntry& entry : directory.entries())
        segments_.push_back(std::make_unique<const Segment>(
            bytes_.bytes().subspan(entry.offset, entry.bytes), entry));
    requireIntact();
}

std::size_t ArchiveReader::segmentOf(std::uint64_t number) const noexcept {
    if (segments_.size() == 1) return 0;
    const auto after = std::ranges::upper_bound(
        segments_, number, {},
        [](const auto& segment) { return segment->entry().firstNumber; });
    return static_cast<std::size_t>(after - segments_.begin()) - 1;
}

// ---- Reading ----

void ArchiveReader::read(std::uint64_t number, std::string& into) const {
    const Segment& of = segment(segmentOf(number));
    PathCursor paths(of);
    into = paths.at(placeOf(of, number - of.entry().firstNumber));
    requireIntact();
}

bool ArchiveReader::readStored(const Segment& segment, std::uint64_t first,
                               std::uint64_t last, PathVisitor visitor) const {
    const std::uint64_t base = segment.entry().firstNumber;
    PathCursor paths(segment);
    for (std::uint64_t place = first - base; place < last - base; ++place) {
        const std::string_view path = paths.at(place);
        requireIntact();
        if (!visitor(base + place, path)) return false;
    }
    return true;
}

bool ArchiveReader::read(std::uint64_t first, std::uint64_t last,
                         PathVisitor visitor) const {
    const auto checked = [&](std::uint64_t number, std::string_view path) {
        requireIntact();
        return visitor(number, path);
    };
    while (first < last) {
        const Segment& current = segment(segmentOf(first));
        const std::uint64_t end =
            std::min(last, current.entry().firstNumber + current.entry().paths);
        const bool goesOn =
            isInPlace(current)
                ? readStored(current, first, end, visitor)
                : ScatteredReader(current).read(first, end, checked);
        if (!goesOn) return false;
        first = end;
    }
    return true;
}

bool ArchiveReader::read(std::span<const std::uint64_t> numbers,
                         PathVisitor visitor) const {
    const auto checked = [&](std::uint64_t number, std::string_view path) {
        requireIntact();
        return visitor(number, path);
    };
    while (!numbers.empty()) {
        const Segment& current = segment(segmentOf(numbers.front()));
        const std::uint64_t base = current.entry().firstNumber;
        const auto end = std::ranges::find_if(numbers, [&](auto number) {
            return number - base >= current.size();
        });
        const auto count = static_cast<std::size_t>(end - numbers.begin());
        if (!ScatteredReader(current).read(numbers.first(count), checked))
            return false;
        numbers = numbers.subspan(count);
    }
    return true;
}

}  // namespace tessel::archive
