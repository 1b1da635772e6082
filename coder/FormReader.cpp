#include "coder/FormReader.hpp"

#include <algorithm>
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

void FormReader::readTree(ByteCursor& cursor) {
    const auto nodeCodes = sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
    const std::uint64_t count = cursor.takeUint(PackedSizeT::Uint64);
    const PackedSizeT width = takeWidth(cursor);
    if (count > 0) cursor.requireItems(count, sixpacks::widthBytes(width));
    // All values are judged before the first node is made.
    ByteCursor values = cursor;
    numbering.maxCodeBytes = 0;
    for (std::uint64_t i = 0; i < count; ++i)
        numbering.maxCodeBytes.raise(
            sixpacks::unpackVector(cursor, width).size());
    numbering.pathCount = 0;
    if (nodeCodes.empty() && count == 0) return;
    TreeBuilder builder(*tree, nodeCodes);
    for (std::uint64_t i = 0; !builder.complete(); ++i) {
        if (i == count) throw DamagedFormException();
        builder.add(sixpacks::unpackVector(values, width));
    }
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
        numbering.duplicates[number] = std::move(track);
    }
    numbering.pathCount += numbering.duplicates.size();
}

}  // namespace tessel
