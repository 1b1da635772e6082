#pragma once

#include <algorithm>
#include <cstdint>
#include <string_view>

#include "archive/BitLoad.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// Every n-th folder in plain text, with the name blocks in which they are first
// named: the top of a search by path.
//
// Ownership: borrows the segment, which must have this section.
// Threads: const members from any number of threads.
class FolderHeads {
public:
    explicit FolderHeads(const Segment& segment) noexcept;

    std::uint32_t size() const noexcept { return size_; }

    // All throw DamagedArchiveException; i must be below size().
    std::string_view folder(std::uint32_t i) const {
        // One look at both offsets: this is the inner step of a search.
        const std::uint64_t at = entryOf(i);
        segment_->require(Section::FolderHeads, at, folderHeadBytes + 4);
        const std::uint32_t begin = field(at);
        const std::uint32_t end = field(at + folderHeadBytes);
        if (begin > end) [[unlikely]]
            segment_->fail(Section::FolderHeads, at,
                           "The offsets of folder heads descend.");
        segment_->require(Section::FolderHeads, textStart_ + begin,
                          end - begin);
        const auto* const text =
            segment_->dataOf(Section::FolderHeads) + textStart_ + begin;
        return {reinterpret_cast<const char*>(text), end - begin};
    }

    // The folder's number, and the block of folders that it starts.
    std::uint32_t number(std::uint32_t i) const noexcept {
        return folderBlock(i) * segment_->head().foldersPerBlock;
    }
    std::uint32_t folderBlock(std::uint32_t i) const noexcept {
        return i * segment_->head().folderBlocksPerHead;
    }

    // The first block with a name of head i, or for i = size() the last block
    // of all. At least 0 and below the number of name blocks.
    std::uint32_t nameBlock(std::uint32_t i) const {
        const std::uint64_t at = entryOf(i) + 4;
        segment_->require(Section::FolderHeads, at, 4);
        return std::min(field(at), segment_->nameBlocks() - 1);
    }

    // Whether offsets start at 0 and end with the text, and blocks with the
    // number of blocks.
    bool fillsSection() const;

private:
    static std::uint64_t entryOf(std::uint32_t i) noexcept {
        return std::uint64_t{folderHeadBytes} * i;
    }
    // The number there, whose bytes must be sound.
    std::uint32_t field(std::uint64_t at) const noexcept {
        return loadLittle<std::uint32_t>(
            segment_->dataOf(Section::FolderHeads) + at);
    }

    const Segment* segment_;
    std::uint32_t size_;
    std::uint64_t textStart_;
};

}  // namespace tessel::archive
