#include "archive/SegmentSurvey.hpp"

#include <algorithm>

#include "archive/ArchiveExceptions.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::span<const std::uint8_t>;

// More than any archive has, so that sums of offsets and sizes cannot wrap.
constexpr std::uint64_t maxBytes = std::uint64_t{1} << 60;

// The bytes from `offset` on, as far as there are any.
Bytes rest(Bytes archive, std::uint64_t offset) {
    return archive.subspan(std::min<std::uint64_t>(offset, archive.size()));
}

std::optional<SegmentEntry> entryIn(Bytes directory, std::uint64_t index) {
    try {
        const auto entry = SegmentEntry::unpack(
            rest(directory, index * segmentEntryBytes), index);
        if (entry.offset < maxBytes && entry.bytes < maxBytes &&
            entry.firstNumber < maxBytes && entry.paths <= maxPathsPerSegment)
            return entry;
    } catch (const DamagedFormException&) {
    }
    return std::nullopt;
}

std::optional<SegmentHead> headAt(Bytes archive, std::uint64_t offset) {
    try {
        return SegmentHead::unpack(rest(archive, offset));
    } catch (const DamagedFormException&) {
        return std::nullopt;
    }
}

}  // namespace

SegmentSurvey::SegmentSurvey(Bytes archive) : archive_(archive) {
    readHeader();
    followSegments();
    if (!paths_) recognizeEnd();
}

void SegmentSurvey::readHeader() {
    try {
        const FileHeader header = FileHeader::unpack(archive_);
        if (header.version > formatVersion)
            throw UnsupportedArchiveVersionException(header.version);
        paths_ = header.paths;
        readDirectory(header);
    } catch (const DamagedFormException&) {
        damages_.push_back({0, fileHeaderBytes, "The header is damaged."});
    }
}

void SegmentSurvey::readDirectory(const FileHeader& header) {
    if (header.fileBytes != archive_.size())
        damages_.push_back(
            {std::min<std::uint64_t>(header.fileBytes, archive_.size()), 0,
             "The archive was cut or lengthened."});
    const Bytes directory = rest(archive_, header.directoryOffset);
    const std::uint64_t count = std::min<std::uint64_t>(
        header.segments, directory.size() / segmentEntryBytes);
    for (std::uint64_t i = 0; i < count; ++i) {
        const auto entry = entryIn(directory, i);
        if (entry &&
            (directory_.empty() || directory_.back().offset < entry->offset))
            directory_.push_back(*entry);
        else
            damages_.push_back({header.directoryOffset + i * segmentEntryBytes,
                                segmentEntryBytes,
                                "An entry of the directory is damaged."});
    }
}

// The segment at the end of those found so far, or the directory's next one
// after it.
std::optional<SegmentEntry> SegmentSurvey::next() const {
    const std::uint64_t offset = end();
    const auto known =
        std::ranges::lower_bound(directory_, offset, {}, &SegmentEntry::offset);
    const bool isKnown =
        known != directory_.end() && known->firstNumber >= endNumber();
    if (isKnown && known->offset == offset) return *known;
    if (const auto head = headAt(archive_, offset))
        return SegmentEntry{offset, head->segmentBytes(), endNumber(),
                            head->paths};
    if (isKnown) return *known;
    return std::nullopt;
}

void SegmentSurvey::followSegments() {
    while (!paths_ || endNumber() < *paths_) {
        const auto entry = next();
        if (!entry || entry->bytes == 0 || entry->paths == 0) return;
        segments_.push_back(*entry);
    }
}

// Without a header, the list is complete if a directory of just these segments
// follows them.
void SegmentSurvey::recognizeEnd() {
    const Bytes directory = rest(archive_, end());
    if (directory.size() != segments_.size() * segmentEntryBytes) return;
    for (std::uint64_t i = 0; i < segments_.size(); ++i)
        if (!entryIn(directory, i)) return;
    if (!segments_.empty()) paths_ = endNumber();
}

std::uint64_t SegmentSurvey::end() const noexcept {
    if (segments_.empty()) return fileHeaderBytes;
    return segments_.back().offset + segments_.back().bytes;
}

std::uint64_t SegmentSurvey::endNumber() const noexcept {
    if (segments_.empty()) return 0;
    return segments_.back().firstNumber + segments_.back().paths;
}

}  // namespace tessel::archive
