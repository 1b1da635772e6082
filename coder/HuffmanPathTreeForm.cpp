// The stored form of a coder.
//
//   | payload length, 8 bytes | body: the payload, or its zlib stream |
//
// Payload, all integers little-endian, width codes as PackedSizeT:
//
//   shape        8 bytes length, then boolTree as a bit block
//   node codes   8 bytes length, then one code per node (BPathTreeForm.cpp)
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
#include <stdexcept>
#include <utility>

#include "coder/HuffmanCode.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "coder/PathNumbering.hpp"
#include "packing/ByteCursor.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/NodeCode.hpp"
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

// ---- Writing ----

// What the writer must know of a path tree before it writes.
struct TreeStats {
    std::size_t nodes = 0;
    std::size_t valueBytes = 0;
    std::size_t maxValueBytes = 0;
    std::size_t maxChildren = 0;

    static TreeStats collect(const BPathTree& tree) {
        TreeStats stats;
        stats.maxChildren = tree.root->children().size();
        for (NodeWalk walk(*tree.root); walk.next();) {
            const BNode& node = walk.node();
            const std::size_t length = node.value().size();
            ++stats.nodes;
            stats.valueBytes += length;
            stats.maxValueBytes = std::max(stats.maxValueBytes, length);
            stats.maxChildren =
                std::max(stats.maxChildren, node.children().size());
        }
        return stats;
    }
};

// The largest position and the greatest length of some tracks.
struct TrackMaxima {
    std::uint64_t position = 0;
    std::uint64_t length = 0;

    void add(const PathTrack& track) {
        length = std::max<std::uint64_t>(length, track.size());
        for (const std::uint64_t value : track)
            position = std::max(position, value);
    }
};

// Appends the payload. Each width follows from the maximum that the coder
// keeps for the group, or from a larger value that is really there: no
// value loses bytes.
class FormWriter {
public:
    FormWriter(const BPathTree& tree, const PathNumbering& numbering,
               Bytes& out)
        : tree_(tree),
          numbering_(numbering),
          stats_(TreeStats::collect(tree)),
          out_(out) {}

    void write(const std::vector<bool>& shape) {
        out_.reserve(out_.size() + stats_.valueBytes + 3 * stats_.nodes +
                     numbering_.partitionEnds.size() * sizeof(std::uint64_t) +
                     2 * numbering_.partitionTracks.memoryBytes());
        writeShape(shape);
        writeTree();
        if (!numbering_.partitionTracks.empty()) writePartitions();
        if (!numbering_.duplicates.empty()) writeDuplicates();
    }

private:
    void writeShape(const std::vector<bool>& shape) {
        Bytes block;
        sixpacks::boolVecToBytes(block, shape);
        sixpacks::packVector(block, out_, PackedSizeT::Uint64);
    }

    // Codes and values in one walk: the place of the codes is made first.
    void writeTree() {
        packUint(stats_.nodes, PackedSizeT::Uint64, out_);
        std::size_t codeAt = out_.size();
        out_.resize(out_.size() + stats_.nodes);
        packUint(stats_.nodes, PackedSizeT::Uint64, out_);
        const PackedSizeT width = sixpacks::packPackedSizeT(
            std::max<std::uint64_t>(numbering_.maxCodeBytes,
                                    stats_.maxValueBytes),
            out_);
        for (NodeWalk walk(*tree_.root); walk.next();) {
            out_[codeAt++] = nodecode::of(walk);
            const ComponentView value = walk.node().value();
            packUint(value.size(), width, out_);
            out_.insert(out_.end(), value.begin(), value.end());
        }
    }

    void writePartitions() {
        const std::vector<std::uint64_t>& ends = numbering_.partitionEnds;
        std::uint64_t maxEnd = numbering_.pathCount;
        for (const std::uint64_t end : ends) maxEnd = std::max(maxEnd, end);
        TrackMaxima maxima{stats_.maxChildren,
                           numbering_.maxPartitionTrackLength};
        numbering_.partitionTracks.forEach(
            [&](const PathTrack& track) { maxima.add(track); });

        out_.push_back(partitionMarker);
        const PackedSizeT endWidth = sixpacks::packPackedSizeT(maxEnd, out_);
        const PackedSizeT countWidth =
            sixpacks::packPackedSizeT(ends.size(), out_);
        packUint(ends.size(), countWidth, out_);
        for (const std::uint64_t end : ends) packUint(end, endWidth, out_);
        packUint(numbering_.partitionTracks.size(), PackedSizeT::Uint64, out_);
        const TrackWidths widths = writeWidths(maxima);
        numbering_.partitionTracks.forEach(
            [&](const PathTrack& track) { writeTrack(track, widths); });
    }

    void writeDuplicates() {
        TrackMaxima maxima{stats_.maxChildren,
                           numbering_.maxDuplicateTrackLength};
        std::uint64_t maxNumber = numbering_.maxDuplicatePathNumber;
        for (const auto& [number, track] : numbering_.duplicates) {
            maxima.add(track);
            maxNumber = std::max(maxNumber, number);
        }
        out_.push_back(duplicatesMarker);
        const TrackWidths widths = writeWidths(maxima);
        const PackedSizeT numberWidth =
            sixpacks::packPackedSizeT(maxNumber, out_);
        for (const auto& [number, track] : numbering_.duplicates) {
            packUint(number, numberWidth, out_);
            writeTrack(track, widths);
        }
    }

    struct TrackWidths {
        PackedSizeT position;
        PackedSizeT length;
    };

    TrackWidths writeWidths(const TrackMaxima& maxima) {
        const PackedSizeT position =
            sixpacks::packPackedSizeT(maxima.position, out_);
        return {position, sixpacks::packPackedSizeT(maxima.length, out_)};
    }

    void writeTrack(const PathTrack& track, TrackWidths widths) {
        packUint(track.size(), widths.length, out_);
        for (const std::uint64_t position : track)
            packUint(position, widths.position, out_);
    }

    const BPathTree& tree_;
    const PathNumbering& numbering_;
    const TreeStats stats_;
    Bytes& out_;
};

// ---- Reading ----

PackedSizeT takeWidth(ByteCursor& cursor) {
    return static_cast<PackedSizeT>(cursor.takeByte());
}

// What a stored form holds, apart from any coder until all of it is known to
// be sound.
class FormReader {
public:
    // New partitions are appended to those of `before`.
    explicit FormReader(PathNumbering before) : numbering(std::move(before)) {
        numbering.duplicates.clear();
    }

    // An unknown marker ends the reading; what follows it is ignored.
    void read(ByteCursor& cursor) {
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

    std::vector<bool> shape;
    std::unique_ptr<BPathTree> tree = std::make_unique<BPathTree>();
    PathNumbering numbering;

private:
    void readShape(ByteCursor& cursor) {
        const auto block = sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
        if (block.empty()) return;
        sixpacks::bytesToBoolVec({block.begin(), block.end()}, shape);
        if (!HuffmanCode::isShape(shape)) throw DamagedFormException();
    }

    void readTree(ByteCursor& cursor) {
        const auto nodeCodes =
            sixpacks::unpackVector(cursor, PackedSizeT::Uint64);
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

    void readPartitions(ByteCursor& cursor) {
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
            sixpacks::unpackSizeTVector(track, cursor, positionWidth,
                                        lengthWidth);
            numbering.maxPartitionTrackLength = std::max<std::uint64_t>(
                numbering.maxPartitionTrackLength, track.size());
            numbering.partitionTracks.push_back(track);
        }
        numbering.partitionTracks.shrinkToFit();
    }

    void readDuplicates(ByteCursor& cursor) {
        const PackedSizeT positionWidth = takeWidth(cursor);
        const PackedSizeT lengthWidth = takeWidth(cursor);
        const PackedSizeT numberWidth = takeWidth(cursor);
        numbering.maxDuplicateTrackLength = 0;
        numbering.maxDuplicatePathNumber = 0;
        while (!cursor.empty()) {
            const std::uint64_t number = cursor.takeUint(numberWidth);
            PathTrack track;
            sixpacks::unpackSizeTVector(track, cursor, positionWidth,
                                        lengthWidth);
            numbering.maxDuplicatePathNumber =
                std::max(numbering.maxDuplicatePathNumber, number);
            numbering.maxDuplicateTrackLength = std::max<std::uint64_t>(
                numbering.maxDuplicateTrackLength, track.size());
            numbering.duplicates[number] = std::move(track);
        }
        numbering.pathCount += numbering.duplicates.size();
    }
};

}  // namespace

void HuffmanPathTree::serialize(std::vector<std::uint8_t>& out,
                                bool compress) const {
    if (!HuffmanCode::isShape(boolTree))
        throw std::logic_error("The coder's shape is not that of one tree.");
    const std::size_t before = out.size();
    try {
        packUint(0, PackedSizeT::Uint64, out);  // the length, when it is known
        const std::size_t bodyAt = out.size();
        std::size_t payloadLength = 0;
        if (compress) {
            Bytes payload;
            FormWriter(*pathTree, *numbering_, payload).write(boolTree);
            payloadLength = payload.size();
            sixpacks::appendCompressed(payload, out);
        } else {
            FormWriter(*pathTree, *numbering_, out).write(boolTree);
            payloadLength = out.size() - bodyAt;
        }
        for (std::size_t j = 0; j < sizeof(std::uint64_t); ++j)
            out[before + j] = static_cast<std::uint8_t>(payloadLength >> 8 * j);
    } catch (...) {
        out.resize(before);
        throw;
    }
}

void HuffmanPathTree::deserialize(std::vector<std::uint8_t>& in,
                                  bool compress) {
    ByteCursor form(in);
    const std::uint64_t payloadLength = form.takeUint(PackedSizeT::Uint64);
    const auto body = form.take(form.remaining());
    Bytes payload;
    if (compress) payload = sixpacks::decompressChecked(body, payloadLength);
    ByteCursor cursor(compress ? std::span<const std::uint8_t>(payload) : body);
    FormReader reader(*numbering_);
    reader.read(cursor);
    code_->boolTree = std::move(reader.shape);
    pathTree = std::move(reader.tree);
    *numbering_ = std::move(reader.numbering);
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
