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

#include <stdexcept>
#include <utility>

#include "coder/FormReader.hpp"
#include "coder/FormWriter.hpp"
#include "coder/HuffmanCode.hpp"
#include "coder/HuffmanPathTree.hpp"
#include "packing/Inflater.hpp"
#include "packing/sixpacks.hpp"

namespace tessel {

namespace {

// Reads the payload while it is inflated, so that it is never whole in memory.
// A damaged stream is reported before anything that is wrong with the payload.
void readCompressed(FormReader& reader, std::span<const std::uint8_t> stream,
                    std::uint64_t payloadLength) {
    sixpacks::Inflater inflater(stream, payloadLength);
    sixpacks::ByteCursor cursor(inflater);
    try {
        reader.read(cursor);
    } catch (...) {
        inflater.finish();
        throw;
    }
    inflater.finish();
}

}  // namespace

void HuffmanPathTree::serialize(std::vector<std::uint8_t>& out,
                                bool compress) const {
    if (!HuffmanCode::isShape(boolTree))
        throw std::logic_error("The coder's shape is not that of one tree.");
    const std::size_t before = out.size();
    try {
        sixpacks::packUint(0, sixpacks::PackedSizeT::Uint64,
                           out);  // the length, when it is known
        const std::size_t bodyAt = out.size();
        std::size_t payloadLength = 0;
        if (compress) {
            std::vector<std::uint8_t> payload;
            FormWriter(tree(), *numbering_, payload).write(boolTree);
            payloadLength = payload.size();
            sixpacks::appendCompressed(payload, out);
        } else {
            FormWriter(tree(), *numbering_, out).write(boolTree);
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
    sixpacks::ByteCursor form(in);
    const std::uint64_t payloadLength =
        form.takeUint(sixpacks::PackedSizeT::Uint64);
    FormReader reader(*numbering_);
    if (compress)
        readCompressed(reader, form.take(form.remaining()), payloadLength);
    else
        reader.read(form);
    code_->boolTree = std::move(reader.shape);
    pathTree = std::move(reader.tree);
    *numbering_ = std::move(reader.numbering);
}

std::size_t HuffmanPathTree::serializePathTree(
    std::vector<std::uint8_t>& structure, Components& values) const {
    return tree().serialize(structure, values);
}

std::size_t HuffmanPathTree::deserializePathTree(
    std::vector<std::uint8_t>& structure, Components& values) {
    pathTree = std::make_unique<BPathTree>();
    partitionTracks.forgetFolders();
    pathCount = pathTree->deserialize(structure, values);
    return pathCount;
}

}  // namespace tessel
