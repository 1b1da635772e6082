#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "archive/PieceDecoder.hpp"

namespace tessel::archive {

// FolderDecoder decodes folders by their numbers. It keeps its place, so that
// the folder after the last one costs the decoding of one folder, and any
// other half a block on average.
//
// Ownership: borrows the segment and the output.
// Threads: one thread at a time.
// Cost: no allocation.
class FolderDecoder : private PieceDecoder {
public:
    using PieceDecoder::slack;

    // folder  takes up to maxFolderBytes + slack bytes
    FolderDecoder(const Segment& segment, char* folder)
        : PieceDecoder(segment, Section::Folders),
          folder_(folder),
          limit_(folder + segment.head().maxFolderBytes),
          perBlock_(segment.head().foldersPerBlock) {}

    // The folder with this number; valid until the next call. Throws
    // DamagedArchiveException, also if there is no such folder.
    std::string_view at(std::uint32_t folder);

    // The last folder that at() returned.
    std::string_view folder() const noexcept { return {folder_, length_}; }

    // Whether the block holds nothing more than padding of less than a byte.
    bool isAtEnd() const noexcept { return PieceDecoder::isAtEnd(position_); }

private:
    void start(std::uint32_t folder);
    void decodeNext();
    unsigned takePrefix(Position& at) const;

    Position position_;
    char* folder_;
    const char* limit_;
    std::size_t length_ = 0;
    std::uint32_t perBlock_;
    std::uint32_t next_ = 0;      // the folder that decodeNext would decode
    std::uint32_t blockEnd_ = 0;  // the first folder of the next block
};

}  // namespace tessel::archive
