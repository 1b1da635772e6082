#include "coder/FormWriter.hpp"

#include <algorithm>

#include "coder/FormMarkers.hpp"
#include "pathtree/NodeCode.hpp"
#include "pathtree/NodeWalk.hpp"

namespace tessel {

using sixpacks::PackedSizeT;
using sixpacks::packUint;

FormWriter::TreeStats FormWriter::TreeStats::collect(const BPathTree& tree) {
    TreeStats stats;
    stats.maxChildren = tree.root->children().size();
    for (NodeWalk walk(*tree.root); walk.next();) {
        const std::size_t length = walk.node().value().size();
        ++stats.nodes;
        stats.valueBytes += length;
        stats.maxValueBytes = std::max(stats.maxValueBytes, length);
        stats.maxChildren = std::max(stats.maxChildren, walk.childCount());
    }
    return stats;
}

void FormWriter::TrackMaxima::add(const PathTrack& track) {
    length = std::max<std::uint64_t>(length, track.size());
    for (const std::uint64_t value : track)
        position = std::max(position, value);
}

FormWriter::FormWriter(const BPathTree& tree, const PathNumbering& numbering,
                       std::vector<std::uint8_t>& out)
    : tree_(tree),
      numbering_(numbering),
      stats_(TreeStats::collect(tree)),
      out_(out) {}

void FormWriter::write(const std::vector<bool>& shape) {
    out_.reserve(out_.size() + stats_.valueBytes + 3 * stats_.nodes +
                 numbering_.partitionEnds.size() * sizeof(std::uint64_t) +
                 2 * numbering_.partitionTracks.memoryBytes());
    writeShape(shape);
    writeTree();
    if (!numbering_.partitionTracks.empty()) writePartitions();
    if (!numbering_.duplicates.empty()) writeDuplicates();
}

void FormWriter::writeShape(const std::vector<bool>& shape) {
    std::vector<std::uint8_t> block;
    sixpacks::boolVecToBytes(block, shape);
    sixpacks::packVector(block, out_, PackedSizeT::Uint64);
}

// Codes and values in one walk: the place of the codes is made first.
void FormWriter::writeTree() {
    packUint(stats_.nodes, PackedSizeT::Uint64, out_);
    std::size_t codeAt = out_.size();
    out_.resize(out_.size() + stats_.nodes);
    packUint(stats_.nodes, PackedSizeT::Uint64, out_);
    const PackedSizeT width = sixpacks::packPackedSizeT(
        std::max<std::uint64_t>(numbering_.maxCodeBytes, stats_.maxValueBytes),
        out_);
    for (NodeWalk walk(*tree_.root); walk.next();) {
        out_[codeAt++] = nodecode::of(walk);
        const ComponentView value = walk.node().value();
        packUint(value.size(), width, out_);
        out_.insert(out_.end(), value.begin(), value.end());
    }
}

void FormWriter::writePartitions() {
    const std::vector<std::uint64_t>& ends = numbering_.partitionEnds;
    std::uint64_t maxEnd = numbering_.pathCount;
    for (const std::uint64_t end : ends) maxEnd = std::max(maxEnd, end);
    TrackMaxima maxima{stats_.maxChildren, numbering_.maxPartitionTrackLength};
    numbering_.partitionTracks.forEach(
        [&](const PathTrack& track) { maxima.add(track); });

    out_.push_back(formmarkers::partitions);
    const PackedSizeT endWidth = sixpacks::packPackedSizeT(maxEnd, out_);
    const PackedSizeT countWidth = sixpacks::packPackedSizeT(ends.size(), out_);
    packUint(ends.size(), countWidth, out_);
    for (const std::uint64_t end : ends) packUint(end, endWidth, out_);
    packUint(numbering_.partitionTracks.size(), PackedSizeT::Uint64, out_);
    const TrackWidths widths = writeWidths(maxima);
    numbering_.partitionTracks.forEach(
        [&](const PathTrack& track) { writeTrack(track, widths); });
}

void FormWriter::writeDuplicates() {
    TrackMaxima maxima{stats_.maxChildren, numbering_.maxDuplicateTrackLength};
    std::uint64_t maxNumber = numbering_.maxDuplicatePathNumber;
    for (const auto& [number, track] : numbering_.duplicates) {
        maxima.add(track);
        maxNumber = std::max(maxNumber, number);
    }
    out_.push_back(formmarkers::duplicates);
    const TrackWidths widths = writeWidths(maxima);
    const PackedSizeT numberWidth = sixpacks::packPackedSizeT(maxNumber, out_);
    for (const auto& [number, track] : numbering_.duplicates) {
        packUint(number, numberWidth, out_);
        writeTrack(track, widths);
    }
}

FormWriter::TrackWidths FormWriter::writeWidths(const TrackMaxima& maxima) {
    const PackedSizeT position =
        sixpacks::packPackedSizeT(maxima.position, out_);
    return {position, sixpacks::packPackedSizeT(maxima.length, out_)};
}

void FormWriter::writeTrack(const PathTrack& track, TrackWidths widths) {
    packUint(track.size(), widths.length, out_);
    for (const std::uint64_t position : track)
        packUint(position, widths.position, out_);
}

}  // namespace tessel
