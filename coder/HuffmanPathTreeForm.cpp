// The stored form of a coder.
//
//   | payload length, 8 bytes | body: the payload, or its zlib stream |
//
// Payload, all integers little-endian, width codes as PackedSizeT:
//
//   shape        8 bytes length, then boolTree as a bit block
//   node codes   8 bytes length, then one code a node (BPathTreeForm.cpp)
//   values       8 bytes count, 1 byte width of lengths, then for each node
//                its value's length and bytes
//   partitions   only if there are tracks:
//                  0x01
//                  width of ends, width of their count
//                  count, then each end
//                  8 bytes track count
//                  width of positions, width of track lengths
//                  each track: length, then each position
//   duplicates   only if there are any, always last:
//                  0x00
//                  width of positions, width of track lengths,
//                  width of path numbers
//                  each entry: path number, track length, each position
//
// The tree string, the frequencies and the state of iteration are not in it.

#include <algorithm>
#include <limits>
#include <stdexcept>

#include "coder/HuffmanPathTree.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/NodeWalk.hpp"
#include "pathtree/TreeBuilder.hpp"

namespace tessel {

namespace {

using sixpacks::ByteCursor;
using sixpacks::PackedSizeT;
using sixpacks::packUint;
using Bytes = std::vector<std::uint8_t>;

// Stored as bytes; never change them.
constexpr std::uint8_t partitionMarker = 0x01;
constexpr std::uint8_t duplicatesMarker = 0x00;

PackedSizeT takeWidth(ByteCursor& cursor) {
    return static_cast<PackedSizeT>(cursor.takeByte());
}

// True for the pre-order shape of exactly one binary tree whose inner nodes
// all have two children, and for no shape at all.
bool isShape(const std::vector<bool>& bits) {
    if (bits.empty()) return true;
    if (bits.size() > std::numeric_limits<std::int32_t>::max()) return false;
    std::size_t awaited = 1;
    for (const bool isLeaf : bits) {
        if (awaited == 0) return false;
        if (isLeaf)
            --awaited;
        else
            ++awaited;
    }
    return awaited == 0;
}

// ---- Writing ----

// What the writer must know of a path tree before it writes.
struct TreeExtent {
    std::size_t nodes = 0;
    std::size_t valueBytes = 0;
    std::size_t longestValue = 0;
    std::size_t mostChildren = 0;
};

TreeExtent measure(const BPathTree& tree) {
    TreeExtent extent;
    extent.mostChildren = tree.root->children().size();
    for (NodeWalk walk(*tree.root); walk.next();) {
        const BNode& node = walk.node();
        const std::size_t length = node.value().size();
        ++extent.nodes;
        extent.valueBytes += length;
        extent.longestValue = std::max(extent.longestValue, length);
        extent.mostChildren =
            std::max(extent.mostChildren, node.children().size());
    }
    return extent;
}

void packShape(const std::vector<bool>& boolTree, Bytes& out) {
    Bytes block;
    sixpacks::boolVecToBytes(block, boolTree);
    sixpacks::packVector(block, out, PackedSizeT::Uint64);
}

// Codes and values in one walk: the codes go to their place ahead.
void packTree(const BPathTree& tree, const TreeExtent& extent,
              std::uint64_t longestCode, Bytes& out) {
    packUint(extent.nodes, PackedSizeT::Uint64, out);
    std::size_t codeAt = out.size();
    out.resize(out.size() + extent.nodes);
    packUint(extent.nodes, PackedSizeT::Uint64, out);
    const PackedSizeT width = sixpacks::packPackedSizeT(
        std::max<std::uint64_t>(longestCode, extent.longestValue), out);
    for (NodeWalk walk(*tree.root); walk.next();) {
        out[codeAt++] = nodecode::of(walk);
        const ComponentView value = walk.node().value();
        packUint(value.size(), width, out);
        out.insert(out.end(), value.begin(), value.end());
    }
}

// The largest position and the longest of some tracks.
struct TrackExtent {
    std::uint64_t position = 0;
    std::uint64_t length = 0;

    void include(const PathTrack& track) {
        length = std::max<std::uint64_t>(length, track.size());
        for (const std::uint64_t value : track)
            position = std::max(position, value);
    }
};

}  // namespace

void HuffmanPathTree::serialize(std::vector<std::uint8_t>& out,
                                bool compress) const {
    if (!isShape(boolTree))
        throw std::logic_error("The coder's shape is not that of one tree.");
    const TreeExtent extent = measure(*pathTree);
    Bytes payload;
    payload.reserve(extent.valueBytes + 3 * extent.nodes +
                    partitionEnds.size() * sizeof(std::uint64_t) +
                    2 * partitionTracks.memoryBytes());
    packShape(boolTree, payload);
    packTree(*pathTree, extent, maxCodeBytes, payload);
    if (!partitionTracks.empty()) packPartitions(extent.mostChildren, payload);
    if (!duplicates.empty()) packDuplicates(extent.mostChildren, payload);

    packUint(payload.size(), PackedSizeT::Uint64, out);
    if (compress) payload = sixpacks::compressUint8(payload);
    out.insert(out.end(), payload.begin(), payload.end());
}

// Each width follows from the maximum that the coder keeps for the group,
// or from a larger value that is really there: a form is never cut.
void HuffmanPathTree::packPartitions(std::size_t mostChildren,
                                     std::vector<std::uint8_t>& out) const {
    std::uint64_t largestEnd = pathCount;
    for (const std::uint64_t end : partitionEnds)
        largestEnd = std::max(largestEnd, end);
    TrackExtent extent{mostChildren, maxPartitionTrackLength};
    partitionTracks.forEach(
        [&](const PathTrack& track) { extent.include(track); });

    out.push_back(partitionMarker);
    const PackedSizeT endWidth = sixpacks::packPackedSizeT(largestEnd, out);
    const PackedSizeT countWidth =
        sixpacks::packPackedSizeT(partitionEnds.size(), out);
    packUint(partitionEnds.size(), countWidth, out);
    for (const std::uint64_t end : partitionEnds) packUint(end, endWidth, out);
    packUint(partitionTracks.size(), PackedSizeT::Uint64, out);
    const PackedSizeT positionWidth =
        sixpacks::packPackedSizeT(extent.position, out);
    const PackedSizeT lengthWidth =
        sixpacks::packPackedSizeT(extent.length, out);
    partitionTracks.forEach([&](const PathTrack& track) {
        packUint(track.size(), lengthWidth, out);
        for (const std::uint64_t position : track)
            packUint(position, positionWidth, out);
    });
}

void HuffmanPathTree::packDuplicates(std::size_t mostChildren,
                                     std::vector<std::uint8_t>& out) const {
    TrackExtent extent{mostChildren, maxDuplicateTrackLength};
    std::uint64_t largestNumber = maxDuplicatePathNumber;
    for (const auto& [number, track] : duplicates) {
        extent.include(track);
        largestNumber = std::max(largestNumber, number);
    }
    out.push_back(duplicatesMarker);
    const PackedSizeT positionWidth =
        sixpacks::packPackedSizeT(extent.position, out);
    const PackedSizeT lengthWidth =
        sixpacks::packPackedSizeT(extent.length, out);
    const PackedSizeT numberWidth =
        sixpacks::packPackedSizeT(largestNumber, out);
    for (const auto& [number, track] : duplicates) {
        packUint(number, numberWidth, out);
        sixpacks::packSizeTVector(track, out, positionWidth, lengthWidth);
    }
}

// ---- Reading ----

// What a stored form holds, until all of it is known to be sound.
struct HuffmanPathTree::LoadedForm {
    std::vector<bool> boolTree;
    std::unique_ptr<BPathTree> pathTree = std::make_unique<BPathTree>();
    std::uint64_t pathCount = 0;
    std::uint64_t maxCodeBytes = 0;
    std::map<std::uint64_t, PathTrack> duplicates;
    std::vector<std::uint64_t> partitionEnds;
    PathTracks partitionTracks;
    bool endsAscend = true;
    std::uint64_t maxPartitionTrackLength = 0;
    std::uint64_t maxDuplicateTrackLength = 0;
    std::uint64_t maxDuplicatePathNumber = 0;

    void read(ByteCursor& cursor);
    void readShape(ByteCursor& cursor);
    void readTree(ByteCursor& cursor);
    void readPartitions(ByteCursor& cursor);
    void readDuplicates(ByteCursor& cursor);
};

void HuffmanPathTree::LoadedForm::readShape(ByteCursor& cursor) {
    const auto block = sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
    if (block.empty()) return;
    sixpacks::bytesToBoolVec({block.begin(), block.end()}, boolTree);
    if (!isShape(boolTree)) throw DamagedFormException();
}

void HuffmanPathTree::LoadedForm::readTree(ByteCursor& cursor) {
    const auto nodeCodes = sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
    const std::uint64_t count = cursor.takeUint(PackedSizeT::Uint64);
    const PackedSizeT width = takeWidth(cursor);
    if (count > 0) cursor.requireItems(count, sixpacks::widthBytes(width));
    // All values are judged before the first node is made.
    ByteCursor values = cursor;
    for (std::uint64_t i = 0; i < count; ++i)
        maxCodeBytes = std::max<std::uint64_t>(
            maxCodeBytes, sixpacks::unpackVector(cursor, width).size());
    if (nodeCodes.empty() && count == 0) return;
    TreeBuilder builder(*pathTree, nodeCodes);
    for (std::uint64_t i = 0; !builder.complete(); ++i) {
        if (i == count) throw DamagedFormException();
        builder.add(sixpacks::unpackVector(values, width));
    }
    pathCount = builder.leaves();
}

void HuffmanPathTree::LoadedForm::readPartitions(ByteCursor& cursor) {
    const PackedSizeT endWidth = takeWidth(cursor);
    const PackedSizeT endCountWidth = takeWidth(cursor);
    sixpacks::unpackSizeTVector(partitionEnds, cursor, endWidth, endCountWidth);
    endsAscend = std::is_sorted(partitionEnds.begin(), partitionEnds.end());
    if (!partitionEnds.empty()) pathCount = partitionEnds.back();
    const std::uint64_t count = cursor.takeUint(PackedSizeT::Uint64);
    const PackedSizeT positionWidth = takeWidth(cursor);
    const PackedSizeT lengthWidth = takeWidth(cursor);
    if (count > 0)
        cursor.requireItems(count, sixpacks::widthBytes(lengthWidth));
    maxPartitionTrackLength = 0;
    PathTrack track;
    for (std::uint64_t i = 0; i < count; ++i) {
        track.clear();
        sixpacks::unpackSizeTVector(track, cursor, positionWidth, lengthWidth);
        maxPartitionTrackLength =
            std::max<std::uint64_t>(maxPartitionTrackLength, track.size());
        partitionTracks.push_back(track);
    }
    partitionTracks.shrinkToFit();
}

void HuffmanPathTree::LoadedForm::readDuplicates(ByteCursor& cursor) {
    const PackedSizeT positionWidth = takeWidth(cursor);
    const PackedSizeT lengthWidth = takeWidth(cursor);
    const PackedSizeT numberWidth = takeWidth(cursor);
    maxDuplicateTrackLength = 0;
    maxDuplicatePathNumber = 0;
    while (!cursor.empty()) {
        const std::uint64_t number = cursor.takeUint(numberWidth);
        PathTrack track;
        sixpacks::unpackSizeTVector(track, cursor, positionWidth, lengthWidth);
        maxDuplicatePathNumber = std::max(maxDuplicatePathNumber, number);
        maxDuplicateTrackLength =
            std::max<std::uint64_t>(maxDuplicateTrackLength, track.size());
        duplicates[number] = std::move(track);
    }
    pathCount += duplicates.size();
}

// An unknown marker ends the reading: what follows it is nothing to us.
void HuffmanPathTree::LoadedForm::read(ByteCursor& cursor) {
    readShape(cursor);
    readTree(cursor);
    if (cursor.empty()) return;
    std::uint8_t marker = cursor.takeByte();
    if (marker == partitionMarker) {
        readPartitions(cursor);
        if (cursor.empty()) return;
        marker = cursor.takeByte();
    }
    if (marker == duplicatesMarker) readDuplicates(cursor);
}

void HuffmanPathTree::deserialize(std::vector<std::uint8_t>& in,
                                  bool compress) {
    ByteCursor form(in);
    const std::uint64_t payloadLength = form.takeUint(PackedSizeT::Uint64);
    const auto body = form.take(form.remaining());
    Bytes payload;
    if (compress) payload = sixpacks::decompressChecked(body, payloadLength);
    ByteCursor cursor(compress ? std::span<const std::uint8_t>(payload) : body);

    LoadedForm loaded;
    loaded.partitionEnds = partitionEnds;
    loaded.partitionTracks = partitionTracks;
    loaded.maxPartitionTrackLength = maxPartitionTrackLength;
    loaded.maxDuplicateTrackLength = maxDuplicateTrackLength;
    loaded.maxDuplicatePathNumber = maxDuplicatePathNumber;
    loaded.endsAscend = endsAscend_;
    loaded.read(cursor);

    boolTree = std::move(loaded.boolTree);
    pathTree = std::move(loaded.pathTree);
    pathCount = loaded.pathCount;
    maxCodeBytes = loaded.maxCodeBytes;
    duplicates = std::move(loaded.duplicates);
    partitionEnds = std::move(loaded.partitionEnds);
    partitionTracks = std::move(loaded.partitionTracks);
    endsAscend_ = loaded.endsAscend;
    maxPartitionTrackLength = loaded.maxPartitionTrackLength;
    maxDuplicateTrackLength = loaded.maxDuplicateTrackLength;
    maxDuplicatePathNumber = loaded.maxDuplicatePathNumber;
}

std::size_t HuffmanPathTree::serializePathTree(
    std::vector<std::uint8_t>& structure, Components& values) const {
    return pathTree->serialize(structure, values);
}

std::size_t HuffmanPathTree::deserializePathTree(
    std::vector<std::uint8_t>& structure, Components& values) {
    pathTree = std::make_unique<BPathTree>();
    pathCount = pathTree->deserialize(structure, values);
    return pathCount;
}

}  // namespace tessel
