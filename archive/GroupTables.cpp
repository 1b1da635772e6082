#include "archive/GroupTables.hpp"

#include <algorithm>
#include <cstddef>
#include <numeric>
#include <span>
#include <stdexcept>

#include "archive/Format.hpp"

namespace tessel::archive {

namespace {

enum class GroupKind : std::uint8_t { Names, Folders };

// Packs the groups of one section of blocks.
class GroupPacker {
public:
    GroupPacker(GroupKind kind, std::vector<std::uint8_t>& out,
                std::vector<std::uint8_t>& wide)
        : kind_(kind), out_(out), wide_(wide) {}

    // Chunks consist of whole groups, apart from the last one.
    void pack(const Blocks& chunk) {
        for (std::size_t b = 0; b < chunk.lengths.size(); b += blocksPerGroup)
            packGroup(chunk, b,
                      std::min(blocksPerGroup, chunk.lengths.size() - b));
    }

private:
    void packGroup(const Blocks& chunk, std::size_t first, std::size_t count);
    void packLengths(std::span<const std::uint32_t> lengths);
    void packWide(std::span<const std::uint32_t> lengths);

    GroupKind kind_;
    std::vector<std::uint8_t>& out_;
    std::vector<std::uint8_t>& wide_;
    std::uint64_t offset_ = 0;
    std::uint32_t folders_ = 0;
};

void GroupPacker::packGroup(const Blocks& chunk, std::size_t first,
                            std::size_t count) {
    if (offset_ >= wideFlag)
        throw std::length_error("segment too large for its block offsets");
    const auto lengths = std::span(chunk.lengths).subspan(first, count);
    const bool wide = std::ranges::max(lengths) > maxNarrowLength;
    packUint32(static_cast<std::uint32_t>(offset_) | (wide ? wideFlag : 0),
               out_);
    if (kind_ == GroupKind::Names) {
        packUint32(folders_, out_);
        const auto added = std::span(chunk.newFolders).subspan(first, count);
        out_.insert(out_.end(), added.begin(), added.end());
        out_.resize(out_.size() + blocksPerGroup - count);
        folders_ = std::accumulate(added.begin(), added.end(), folders_);
    }
    if (wide)
        packWide(lengths);
    else
        packLengths(lengths);
    offset_ = std::accumulate(lengths.begin(), lengths.end(), offset_);
}

void GroupPacker::packLengths(std::span<const std::uint32_t> lengths) {
    for (const std::uint32_t length : lengths)
        out_.push_back(static_cast<std::uint8_t>(length));
    out_.resize(out_.size() + blocksPerGroup - lengths.size());
}

void GroupPacker::packWide(std::span<const std::uint32_t> lengths) {
    const std::size_t start = wide_.size();
    packUint32(static_cast<std::uint32_t>(start / wideGroupBytes), out_);
    out_.resize(out_.size() + blocksPerGroup - 4);
    for (const std::uint32_t length : lengths) packUint32(length, wide_);
    wide_.resize(start + wideGroupBytes);
}

}  // namespace

GroupTables packGroups(const std::vector<Blocks>& nameChunks,
                       const std::vector<Blocks>& folderChunks) {
    GroupTables tables;
    GroupPacker names(GroupKind::Names, tables.names, tables.wide);
    for (const Blocks& chunk : nameChunks) names.pack(chunk);
    GroupPacker folders(GroupKind::Folders, tables.folders, tables.wide);
    for (const Blocks& chunk : folderChunks) folders.pack(chunk);
    return tables;
}

}  // namespace tessel::archive
