#pragma once

#include <cstdint>
#include <string_view>

#include "archive/FolderDecoder.hpp"
#include "archive/FolderHeads.hpp"
#include "archive/PathBuffer.hpp"
#include "archive/PathCursor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// SortedSearch finds places in a segment whose stored order is that of the
// paths' bytes.
//
// Folders are numbered as they are first named, so their first paths ascend
// with their numbers. That gives a way down by binary search: from the folder
// heads to a block of folders to a folder, then from the name blocks between
// this folder's first path and the next folder's to one block.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
class SortedSearch {
public:
    // The segment must be sorted or rearranged.
    explicit SortedSearch(const Segment& segment);

    // The place of the first path that is not less than this one; the
    // segment's size if all are less. Throws DamagedArchiveException.
    std::uint64_t lowerBound(std::string_view path);

    // The place of the first path equal to this one; the segment's size if
    // there is none. Throws DamagedArchiveException. Faster than lowerBound.
    std::uint64_t find(std::string_view path);

private:
    // What is looked for, and how a folder is compared with it.
    enum class Aim {
        LowerBound,
        // Only the place of a path that is there matters. So the path's own
        // folder starts before it, without a look at its first name.
        Equal
    };
    struct Target {
        std::string_view path;
        Aim aim;
    };
    // A folder and the name blocks in which its first path must be.
    struct Candidate {
        std::string_view folder;
        std::uint32_t number;
        std::uint32_t firstBlock;
        std::uint32_t lastBlock;
    };

    bool startsBefore(const Target& target, const Candidate& candidate);
    std::string_view firstNameOf(const Candidate& candidate);
    std::uint32_t blockOfFirst(std::uint32_t folder, std::uint32_t first,
                               std::uint32_t last) const;

    std::uint32_t lastHeadBefore(const Target& target);
    std::uint32_t lastFolderBefore(const Target& target, std::uint32_t head);
    std::uint32_t lastBlockBefore(const Target& target, std::uint32_t head,
                                  std::uint32_t folder);
    std::uint64_t search(const Target& target);
    std::uint64_t scanBlock(std::string_view path, std::uint32_t block);

    const Segment& segment_;
    FolderHeads heads_;
    PathCursor paths_;
    PathBuffer buffer_;
    FolderDecoder folders_;
};

}  // namespace tessel::archive
