#include "archive/Format.hpp"

#include <algorithm>
#include <bit>
#include <numeric>

#include "archive/SumTree.hpp"
#include "packing/ByteCursor.hpp"

namespace tessel::archive {

using sixpacks::ByteCursor;
using sixpacks::PackedSizeT;

namespace {

constexpr std::uint64_t maxSectionBytes = std::uint64_t{1} << 40;

void requireZeros(ByteCursor& cursor, std::size_t count) {
    require(std::ranges::all_of(cursor.take(count),
                                [](std::uint8_t byte) { return byte == 0; }));
}

// The first `bytes` bytes, if the eight bytes after them are their checksum.
ByteCursor summed(std::span<const std::uint8_t> data, std::size_t bytes,
                  std::uint64_t seed) {
    ByteCursor cursor(data);
    const auto body = cursor.take(bytes);
    require(cursor.takeUint(PackedSizeT::Uint64) == sumOf(body, seed));
    return ByteCursor(body);
}

// Appends the checksum of what was appended since `start`.
void packSum(std::vector<std::uint8_t>& out, std::size_t start,
             std::uint64_t seed) {
    packUint64(sumOf(std::span(out).subspan(start), seed), out);
}

}  // namespace

void require(bool holds) {
    if (!holds) throw DamagedFormException();
}

void packUint32(std::uint32_t value, std::vector<std::uint8_t>& out) {
    for (unsigned shift = 0; shift < 32; shift += 8)
        out.push_back(static_cast<std::uint8_t>(value >> shift));
}

void packUint64(std::uint64_t value, std::vector<std::uint8_t>& out) {
    for (unsigned shift = 0; shift < 64; shift += 8)
        out.push_back(static_cast<std::uint8_t>(value >> shift));
}

// ---- FileHeader ----

void FileHeader::pack(std::vector<std::uint8_t>& out) const {
    const std::size_t start = out.size();
    out.insert(out.end(), fileMagic.begin(), fileMagic.end());
    packUint32(version, out);
    packUint32(0, out);
    packUint64(fileBytes, out);
    packUint64(paths, out);
    packUint64(segments, out);
    packUint64(directoryOffset, out);
    packUint64(0, out);
    packSum(out, start, 0);
}

FileHeader FileHeader::unpack(std::span<const std::uint8_t> file) {
    ByteCursor cursor = summed(file, fileHeaderBytes - 8, 0);
    require(std::ranges::equal(cursor.take(fileMagic.size()), fileMagic));
    FileHeader header;
    header.version =
        static_cast<std::uint32_t>(cursor.takeUint(PackedSizeT::Uint32));
    require(header.version != 0);
    if (header.version > formatVersion) return header;
    requireZeros(cursor, 4);
    header.fileBytes = cursor.takeUint(PackedSizeT::Uint64);
    header.paths = cursor.takeUint(PackedSizeT::Uint64);
    header.segments = cursor.takeUint(PackedSizeT::Uint64);
    header.directoryOffset = cursor.takeUint(PackedSizeT::Uint64);
    requireZeros(cursor, 8);
    require(header.directoryOffset >= fileHeaderBytes &&
            header.directoryOffset <= header.fileBytes);
    const std::uint64_t directory = header.fileBytes - header.directoryOffset;
    require(directory % segmentEntryBytes == 0 &&
            directory / segmentEntryBytes == header.segments);
    return header;
}

// ---- SegmentEntry ----

void SegmentEntry::pack(std::vector<std::uint8_t>& out,
                        std::uint64_t index) const {
    const std::size_t start = out.size();
    packUint64(offset, out);
    packUint64(bytes, out);
    packUint64(firstNumber, out);
    packUint64(paths, out);
    packSum(out, start, index);
}

SegmentEntry SegmentEntry::unpack(std::span<const std::uint8_t> bytes,
                                  std::uint64_t index) {
    ByteCursor cursor = summed(bytes, segmentEntryBytes - 8, index);
    SegmentEntry entry;
    entry.offset = cursor.takeUint(PackedSizeT::Uint64);
    entry.bytes = cursor.takeUint(PackedSizeT::Uint64);
    entry.firstNumber = cursor.takeUint(PackedSizeT::Uint64);
    entry.paths = cursor.takeUint(PackedSizeT::Uint64);
    return entry;
}

// ---- SegmentHead ----

unsigned SegmentHead::numberBits() const noexcept {
    return std::max(1U, static_cast<unsigned>(std::bit_width(paths - 1)));
}

std::uint64_t SegmentHead::offsetOf(Section section) const noexcept {
    std::uint64_t offset = 0;
    for (std::size_t i = 0; i < static_cast<std::size_t>(section); ++i)
        offset += aligned8(sectionBytes[i]);
    return offset;
}

std::uint64_t SegmentHead::bodyBytes() const noexcept {
    return std::accumulate(sectionBytes.begin(), sectionBytes.end(),
                           std::uint64_t{bodyGuardBytes},
                           [](std::uint64_t total, std::uint64_t bytes) {
                               return total + aligned8(bytes);
                           });
}

std::uint64_t SegmentHead::sumTreeBytes() const noexcept {
    return SumTree::storedBytes(bodyBytes(), pieceShift);
}

void SegmentHead::pack(std::vector<std::uint8_t>& out) const {
    const std::size_t start = out.size();
    out.insert(out.end(), segmentTag.begin(), segmentTag.end());
    out.insert(out.end(),
               {static_cast<std::uint8_t>(order), namesPerBlock,
                foldersPerBlock, folderBlocksPerHead, pieceShift, 0, 0, 0});
    packUint32(folders, out);
    packUint64(paths, out);
    packUint64(textBytes, out);
    packUint32(maxNameBytes, out);
    packUint32(maxFolderBytes, out);
    packUint64(segmentBytes(), out);
    for (const std::uint64_t bytes : sectionBytes) packUint64(bytes, out);
    out.resize(start + segmentHeadBytes - 16);
    packUint64(topSum, out);
    packSum(out, start, 0);
}

namespace {

std::uint32_t takeUint32(ByteCursor& cursor) {
    return static_cast<std::uint32_t>(cursor.takeUint(PackedSizeT::Uint32));
}

// Order of the list and sizes of blocks and pieces.
void takeLayout(ByteCursor& cursor, SegmentHead& head) {
    const std::uint8_t order = cursor.takeByte();
    require(order <= static_cast<std::uint8_t>(ListOrder::Rearranged));
    head.order = static_cast<ListOrder>(order);
    head.namesPerBlock = cursor.takeByte();
    head.foldersPerBlock = cursor.takeByte();
    head.folderBlocksPerHead = cursor.takeByte();
    head.pieceShift = cursor.takeByte();
    require(head.namesPerBlock > 0 && head.foldersPerBlock > 0 &&
            head.folderBlocksPerHead > 0 && head.pieceShift >= 9 &&
            head.pieceShift <= 12);
    requireZeros(cursor, 3);
}

void takeCounts(ByteCursor& cursor, SegmentHead& head) {
    head.folders = takeUint32(cursor);
    head.paths = cursor.takeUint(PackedSizeT::Uint64);
    head.textBytes = cursor.takeUint(PackedSizeT::Uint64);
    head.maxNameBytes = takeUint32(cursor);
    head.maxFolderBytes = takeUint32(cursor);
    require(head.paths > 0 && head.paths <= maxPathsPerSegment &&
            head.folders > 0 && head.folders <= head.paths &&
            head.maxNameBytes <= maxComponentBytes &&
            head.maxFolderBytes <= maxComponentBytes);
}

void takeSections(ByteCursor& cursor, SegmentHead& head) {
    for (std::uint64_t& section : head.sectionBytes) {
        section = cursor.takeUint(PackedSizeT::Uint64);
        require(section <= maxSectionBytes);
    }
    require(head.sectionBytes[14] == 0 && head.sectionBytes[15] == 0);
    requireZeros(cursor, 64);
}

}  // namespace

SegmentHead SegmentHead::unpack(std::span<const std::uint8_t> segment) {
    ByteCursor cursor = summed(segment, segmentHeadBytes - 8, 0);
    require(std::ranges::equal(cursor.take(segmentTag.size()), segmentTag));
    SegmentHead head;
    takeLayout(cursor, head);
    takeCounts(cursor, head);
    const std::uint64_t bytes = cursor.takeUint(PackedSizeT::Uint64);
    takeSections(cursor, head);
    head.topSum = cursor.takeUint(PackedSizeT::Uint64);
    require(head.segmentBytes() == bytes);
    return head;
}

}  // namespace tessel::archive
