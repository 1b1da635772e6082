#pragma once

#include <cstdint>
#include <string_view>

#include "archive/PathCursor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// SegmentRules checks what reading leaves unchecked: that a segment whose
// pieces are sound is one that a writer stores. Each check throws
// DamagedArchiveException.
//
// Ownership: borrows the segment.
// Threads: const members from any number of threads.
class SegmentRules {
public:
    explicit SegmentRules(const Segment& segment) noexcept
        : segment_(segment) {}

    // Name blocks from begin up to, but without, end: each ends where the next
    // one starts and has named as many folders; names are without '/' and 0;
    // paths are not empty and, unless the list is as given, not less than
    // their predecessors. Returns the bytes of these paths.
    std::uint64_t checkNames(std::uint32_t begin, std::uint32_t end) const;

    // Folder blocks: each ends where the next one starts; folders are empty or
    // end with '/', and are without 0.
    void checkFolders(std::uint32_t begin, std::uint32_t end) const;

    // No folder comes twice.
    void checkFoldersDiffer() const;

    // The folder heads are the folders, and the blocks, that they should be.
    void checkFolderHeads() const;

    // Section Order holds each number once, and Index is its inverse; or, of a
    // list that is stored as given, Index brings the paths into the order of
    // their bytes.
    void checkOrder() const;

    // Padding is zeros.
    void checkPadding() const;

private:
    void require(Section section, std::uint64_t offset, bool holds,
                 const char* what) const {
        if (!holds) segment_.fail(section, offset, what);
    }
    void checkNamesEnd(std::uint32_t block, const PathCursor& paths) const;
    void checkPath(std::string_view path, std::string_view name,
                   std::uint64_t offset) const;
    void checkRearranged() const;
    void checkIndexed() const;
    bool namesFirst(std::uint32_t nameBlock, std::uint32_t folder) const;

    const Segment& segment_;
};

}  // namespace tessel::archive
