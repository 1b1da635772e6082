#include "coder/FormReader.hpp"

#include <algorithm>
#include <exception>
#include <utility>

#include "coder/FormMarkers.hpp"
#include "coder/HuffmanCode.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/TreeBuilder.hpp"

namespace tessel {

using sixpacks::ByteCursor;
using sixpacks::PackedSizeT;

namespace {

PackedSizeT takeWidth(ByteCursor& cursor) {
    return static_cast<PackedSizeT>(cursor.takeByte());
}

// A copy of the next n bytes, taken in pieces: a source need not have all of
// them in memory beside it.
std::vector<std::uint8_t> takeCopy(ByteCursor& cursor, std::uint64_t n) {
    constexpr std::uint64_t pieceBytes = 4096;
    cursor.requireItems(n, 1);
    std::vector<std::uint8_t> copy;
    copy.reserve(static_cast<std::size_t>(n));
    while (copy.size() < n) {
        const auto piece = cursor.take(std::min(pieceBytes, n - copy.size()));
        copy.insert(copy.end(), piece.begin(), piece.end());
    }
    return copy;
}

}  // namespace

FormReader::FormReader(PathNumbering before) : numbering(std::move(before)) {
    numbering.duplicates.clear();
}

void FormReader::read(ByteCursor& cursor) {
    readShape(cursor);
    readTree(cursor);
    readNumbering(cursor);
    numbering.partitionTracks.findFolders(*tree->root);
}

void FormReader::readNumbering(ByteCursor& cursor) {
    if (cursor.empty()) return;
    std::uint8_t marker = cursor.takeByte();
    if (marker == formmarkers::partitions) {
        readPartitions(cursor);
        if (cursor.empty()) return;
        marker = cursor.takeByte();
    }
    if (marker == formmarkers::duplicates) readDuplicates(cursor);
}

void FormReader::readShape(ByteCursor& cursor) {
    const auto block = sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
    if (block.empty()) return;
    sixpacks::bytesToBoolVec({block.begin(), block.end()}, shape);
    if (!HuffmanCode::isShape(shape)) throw DamagedFormException();
}

// All values are judged, those behind a node that cannot be made, too: a value
// that is no value is reported before such a node.
void FormReader::readTree(ByteCursor& cursor) {
    const std::vector<std::uint8_t> nodeCodes =
        takeCopy(cursor, cursor.takeUint(PackedSizeT::Uint64));
    const std::uint64_t count = cursor.takeUint(PackedSizeT::Uint64);
    const PackedSizeT width = takeWidth(cursor);
    if (count > 0) cursor.requireItems(count, sixpacks::widthBytes(width));
    numbering.maxCodeBytes = 0;
    numbering.pathCount = 0;
    if (nodeCodes.empty() && count == 0) return;
    TreeBuilder builder(*tree, nodeCodes);
    std::exception_ptr failure;
    for (std::uint64_t i = 0; i < count; ++i) {
        const auto value = sixpacks::unpackVector(cursor, width);
        numbering.maxCodeBytes.raise(value.size());
        if (failure || builder.complete()) continue;
        try {
            builder.add(value);
        } catch (...) {
            failure = std::current_exception();
        }
    }
    if (failure) std::rethrow_exception(failure);
    if (!builder.complete()) throw DamagedFormException();
    numbering.pathCount = builder.leaves();
}

void FormReader::readPartitions(ByteCursor& cursor) {
    const PackedSizeT endWidth = takeWidth(cursor);
    const PackedSizeT endCountWidth = takeWidth(cursor);
    std::vector<std::uint64_t>& ends = numbering.partitionEnds;
    sixpacks::unpackSizeTVector(ends, cursor, endWidth, endCountWidth);
    numbering.checkEnds();
    if (!ends.empty()) numbering.pathCount = ends.back();
    const std::uint64_t count = cursor.takeUint(PackedSizeT::Uint64);
    const PackedSizeT positionWidth = takeWidth(cursor);
    const PackedSizeT lengthWidth = takeWidth(cursor);
    if (count > 0)
        cursor.requireItems(count, sixpacks::widthBytes(lengthWidth));
    numbering.maxPartitionTrackLength = 0;
    PathTrack track;
    for (std::uint64_t i = 0; i < count; ++i) {
        track.clear();
        sixpacks::unpackSizeTVector(track, cursor, positionWidth, lengthWidth);
        numbering.maxPartitionTrackLength = std::max<std::uint64_t>(
            numbering.maxPartitionTrackLength, track.size());
        numbering.partitionTracks.push_back(track);
    }
    numbering.partitionTracks.shrinkToFit();
}

void FormReader::readDuplicates(ByteCursor& cursor) {
    const PackedSizeT positionWidth = takeWidth(cursor);
    const PackedSizeT lengthWidth = takeWidth(cursor);
    const PackedSizeT numberWidth = takeWidth(cursor);
    numbering.maxDuplicateTrackLength = 0;
    numbering.maxDuplicatePathNumber = 0;
    while (!cursor.empty()) {
        const std::uint64_t number = cursor.takeUint(numberWidth);
        PathTrack track;
        sixpacks::unpackSizeTVector(track, cursor, positionWidth, lengthWidth);
        numbering.maxDuplicatePathNumber =
            std::max(numbering.maxDuplicatePathNumber, number);
        numbering.maxDuplicateTrackLength = std::max<std::uint64_t>(
            numbering.maxDuplicateTrackLength, track.size());
        // At the end, where a writer's numbers go, without a search.
        numbering.duplicates.insert_or_assign(numbering.duplicates.end(),
                                              number, std::move(track));
    }
    numbering.pathCount += numbering.duplicates.size();
}

}  // namespace tessel
