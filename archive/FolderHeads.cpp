#include "archive/FolderHeads.hpp"

#include <algorithm>

#include "archive/BitLoad.hpp"

namespace tessel::archive {

FolderHeads::FolderHeads(const Segment& segment) noexcept
    : segment_(&segment),
      size_((segment.folderBlocks() + segment.head().folderBlocksPerHead - 1) /
            segment.head().folderBlocksPerHead),
      textStart_((std::uint64_t{size_} + 1) * folderHeadBytes) {}

std::uint32_t FolderHeads::field(std::uint32_t i, std::uint32_t offset) const {
    const std::uint64_t at = std::uint64_t{folderHeadBytes} * i + offset;
    segment_->require(Section::FolderHeads, at, 4);
    return loadLittle<std::uint32_t>(segment_->dataOf(Section::FolderHeads) +
                                     at);
}

std::string_view FolderHeads::folder(std::uint32_t i) const {
    const std::uint32_t begin = field(i, 0);
    const std::uint32_t end = field(i + 1, 0);
    if (begin > end)
        segment_->fail(Section::FolderHeads, std::uint64_t{folderHeadBytes} * i,
                       "The offsets of folder heads descend.");
    segment_->require(Section::FolderHeads, textStart_ + begin, end - begin);
    const auto* const text =
        segment_->dataOf(Section::FolderHeads) + textStart_ + begin;
    return {reinterpret_cast<const char*>(text), end - begin};
}

std::uint32_t FolderHeads::nameBlock(std::uint32_t i) const {
    return std::min(field(i, 4), segment_->nameBlocks() - 1);
}

bool FolderHeads::fillsSection() const {
    return field(0, 0) == 0 && field(size_, 4) == segment_->nameBlocks() &&
           textStart_ + field(size_, 0) ==
               segment_->bytesOf(Section::FolderHeads);
}

}  // namespace tessel::archive
