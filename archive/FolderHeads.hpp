#pragma once

#include <cstdint>
#include <string_view>

#include "archive/Segment.hpp"

namespace tessel::archive {

// Every so many folders in plain text, with the name blocks in which they are
// first named: the top of a search by path.
//
// Ownership: borrows the segment, which must have this section.
// Threads: const members from any number of threads.
class FolderHeads {
public:
    explicit FolderHeads(const Segment& segment) noexcept;

    std::uint32_t size() const noexcept { return size_; }

    // All throw DamagedArchiveException; i must be below size().
    std::string_view folder(std::uint32_t i) const;

    // The folder's number, and the block of folders that it starts.
    std::uint32_t number(std::uint32_t i) const noexcept {
        return folderBlock(i) * segment_->head().foldersPerBlock;
    }
    std::uint32_t folderBlock(std::uint32_t i) const noexcept {
        return i * segment_->head().folderBlocksPerHead;
    }

    // The first block with a name of head i, or for i = size() the last block
    // of all. At least 0 and below the number of name blocks.
    std::uint32_t nameBlock(std::uint32_t i) const;

    // Whether offsets start at 0 and end with the text, and blocks with the
    // number of blocks.
    bool fillsSection() const;

private:
    std::uint32_t field(std::uint32_t i, std::uint32_t offset) const;

    const Segment* segment_;
    std::uint32_t size_;
    std::uint64_t textStart_;
};

}  // namespace tessel::archive
