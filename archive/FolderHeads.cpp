#include "archive/FolderHeads.hpp"

namespace tessel::archive {

FolderHeads::FolderHeads(const Segment& segment) noexcept
    : segment_(&segment),
      size_((segment.folderBlocks() + segment.head().folderBlocksPerHead - 1) /
            segment.head().folderBlocksPerHead),
      textStart_((std::uint64_t{size_} + 1) * folderHeadBytes) {}

bool FolderHeads::fillsSection() const {
    const std::uint64_t last = entryOf(size_);
    segment_->require(Section::FolderHeads, 0, last + folderHeadBytes);
    return field(0) == 0 && field(last + 4) == segment_->nameBlocks() &&
           textStart_ + field(last) == segment_->bytesOf(Section::FolderHeads);
}

}  // namespace tessel::archive
