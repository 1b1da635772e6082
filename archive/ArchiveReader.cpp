#include "archive/ArchiveReader.hpp"

#include <algorithm>
#include <utility>

#include "archive/ArchiveExceptions.hpp"
#include "archive/PathCursor.hpp"
#include "archive/ScatteredReader.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::span<const std::uint8_t>;

FileHeader headerOf(Bytes archive) {
    try {
        return FileHeader::unpack(archive);
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(
            0, "This is no archive, or its header is damaged.");
    }
}

SegmentEntry entryAt(Bytes archive, const FileHeader& header,
                     std::uint64_t index) {
    const std::uint64_t at = header.directoryOffset + index * segmentEntryBytes;
    try {
        return SegmentEntry::unpack(archive.subspan(at, segmentEntryBytes),
                                    index);
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(at, "The segment directory is damaged.");
    }
}

}  // namespace

// ---- Opening ----

ArchiveReader::ArchiveReader(ArchiveBytes bytes) : bytes_(std::move(bytes)) {
    const auto entries = readDirectory();
    segments_.reserve(entries.size());
    for (const SegmentEntry& entry : entries)
        segments_.push_back(std::make_unique<const Segment>(
            bytes_.bytes().subspan(entry.offset, entry.bytes), entry));
}

// The entries must follow each other without gaps, in bytes and in numbers.
std::vector<SegmentEntry> ArchiveReader::readDirectory() {
    const Bytes archive = bytes_.bytes();
    const FileHeader header = headerOf(archive);
    version_ = header.version;
    if (version_ > formatVersion)
        throw UnsupportedArchiveVersionException(version_);
    if (header.fileBytes != archive.size())
        throw DamagedArchiveException(
            std::min<std::uint64_t>(header.fileBytes, archive.size()),
            "The archive was cut or lengthened.");
    std::vector<SegmentEntry> entries;
    std::uint64_t offset = fileHeaderBytes;
    for (std::uint64_t i = 0; i < header.segments; ++i) {
        const SegmentEntry entry = entryAt(archive, header, i);
        if (entry.offset != offset || entry.firstNumber != size_ ||
            entry.bytes > header.directoryOffset - offset ||
            entry.paths > maxPathsPerSegment)
            throw DamagedArchiveException(
                header.directoryOffset + i * segmentEntryBytes,
                "The segment directory contradicts itself.");
        offset += entry.bytes;
        size_ += entry.paths;
        entries.push_back(entry);
    }
    if (offset != header.directoryOffset || size_ != header.paths)
        throw DamagedArchiveException(
            header.directoryOffset,
            "The segment directory does not match the header.");
    return entries;
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
}

bool ArchiveReader::readStored(const Segment& segment, std::uint64_t first,
                               std::uint64_t last, PathVisitor visitor) const {
    const std::uint64_t base = segment.entry().firstNumber;
    PathCursor paths(segment);
    for (std::uint64_t place = first - base; place < last - base; ++place)
        if (!visitor(base + place, paths.at(place))) return false;
    return true;
}

bool ArchiveReader::read(std::uint64_t first, std::uint64_t last,
                         PathVisitor visitor) const {
    while (first < last) {
        const Segment& current = segment(segmentOf(first));
        const std::uint64_t end =
            std::min(last, current.entry().firstNumber + current.entry().paths);
        const bool goesOn =
            isInPlace(current)
                ? readStored(current, first, end, visitor)
                : ScatteredReader(current).read(first, end, visitor);
        if (!goesOn) return false;
        first = end;
    }
    return true;
}

bool ArchiveReader::read(std::span<const std::uint64_t> numbers,
                         PathVisitor visitor) const {
    while (!numbers.empty()) {
        const Segment& current = segment(segmentOf(numbers.front()));
        const std::uint64_t base = current.entry().firstNumber;
        const auto end = std::ranges::find_if(numbers, [&](auto number) {
            return number - base >= current.size();
        });
        const auto count = static_cast<std::size_t>(end - numbers.begin());
        if (!ScatteredReader(current).read(numbers.first(count), visitor))
            return false;
        numbers = numbers.subspan(count);
    }
    return true;
}

}  // namespace tessel::archive
