#include "archive/SegmentDirectory.hpp"

#include "archive/ArchiveExceptions.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {

namespace {

void require(bool holds) {
    if (!holds) throw DamagedFormException();
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

SegmentDirectory SegmentDirectory::unpack(std::span<const std::uint8_t> file) {
    std::uint64_t at = 0;
    try {
        const FileHeader header = FileHeader::unpack(file);
        if (header.version > formatVersion)
            throw UnsupportedArchiveVersionException(header.version);
        require(header.fileBytes == file.size());
        SegmentDirectory directory;
        for (std::uint64_t i = 0; i < header.segments; ++i) {
            at = header.directoryOffset + i * segmentEntryBytes;
            const auto entry = SegmentEntry::unpack(file.subspan(at), i);
            require(entry.offset == directory.end() && entry.paths > 0 &&
                    entry.firstNumber == directory.paths() &&
                    entry.bytes <= header.directoryOffset - entry.offset);
            directory.entries_.push_back(entry);
        }
        require(directory.end() == header.directoryOffset &&
                directory.paths() == header.paths);
        return directory;
    } catch (const DamagedFormException&) {
        throw DamagedArchiveException(
            at, "The header or the directory of segments is damaged.");
    }
}

}  // namespace tessel::archive
