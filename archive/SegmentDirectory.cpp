#include "archive/SegmentDirectory.hpp"

#include <algorithm>

#include "archive/ArchiveExceptions.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {

namespace {

using Bytes = std::span<const std::uint8_t>;

FileHeader headerOf(Bytes file) {
    try {
        return FileHeader::unpack(file);
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(
            0, "This is no archive, or its header is damaged.");
    }
}

std::uint64_t placeOf(std::uint64_t index, const FileHeader& header) {
    return header.directoryOffset + index * segmentEntryBytes;
}

SegmentEntry entryAt(Bytes file, const FileHeader& header,
                     std::uint64_t index) {
    const std::uint64_t at = placeOf(index, header);
    try {
        return SegmentEntry::unpack(file.subspan(at, segmentEntryBytes), index);
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(at, "The segment directory is damaged.");
    }
}

}  // namespace

std::uint64_t SegmentDirectory::end() const noexcept {
    if (entries_.empty()) return fileHeaderBytes;
    return entries_.back().offset + entries_.back().bytes;
}

std::uint64_t SegmentDirectory::paths() const noexcept {
    if (entries_.empty()) return 0;
    return entries_.back().firstNumber + entries_.back().paths;
}

void SegmentDirectory::add(std::uint64_t bytes, std::uint64_t paths) {
    entries_.push_back({end(), bytes, this->paths(), paths});
}

FileHeader SegmentDirectory::pack(std::vector<std::uint8_t>& out) const {
    for (std::size_t i = 0; i < entries_.size(); ++i) entries_[i].pack(out, i);
    FileHeader header;
    header.directoryOffset = end();
    header.fileBytes = end() + entries_.size() * segmentEntryBytes;
    header.paths = paths();
    header.segments = entries_.size();
    return header;
}

// Whether the entry follows the last one without a gap, in bytes and numbers.
bool SegmentDirectory::isNext(const SegmentEntry& entry) const noexcept {
    return entry.offset == end() && entry.firstNumber == paths() &&
           entry.paths > 0 && entry.paths <= maxPathsPerSegment;
}

SegmentDirectory SegmentDirectory::unpack(std::span<const std::uint8_t> file) {
    const FileHeader header = headerOf(file);
    if (header.version > formatVersion)
        throw UnsupportedArchiveVersionException(header.version);
    if (header.fileBytes != file.size())
        throw DamagedArchiveException(
            std::min<std::uint64_t>(header.fileBytes, file.size()),
            "The archive was cut or lengthened.");
    SegmentDirectory directory;
    directory.version_ = header.version;
    for (std::uint64_t i = 0; i < header.segments; ++i) {
        const SegmentEntry entry = entryAt(file, header, i);
        if (!directory.isNext(entry) ||
            entry.bytes > header.directoryOffset - entry.offset)
            throw DamagedArchiveException(
                placeOf(i, header),
                "The segment directory contradicts itself.");
        directory.entries_.push_back(entry);
    }
    if (directory.end() != header.directoryOffset ||
        directory.paths() != header.paths)
        throw DamagedArchiveException(
            header.directoryOffset,
            "The segment directory does not match the header.");
    return directory;
}

}  // namespace tessel::archive
