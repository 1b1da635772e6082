#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/FolderDecoder.hpp"
#include "archive/NumberRange.hpp"
#include "archive/PathBuffer.hpp"
#include "archive/PathCursor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// GivenOrderSearch finds places in a segment whose order tells nothing: it
// decodes the folders one by one, then the names from the first block on in
// which a folder that fits is named.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
// Cost: linear in the folders and in the names after the first that may fit.
class GivenOrderSearch {
public:
    explicit GivenOrderSearch(const Segment& segment);

    // The place of the first path equal to this one; the segment's size if
    // there is none. Throws DamagedArchiveException.
    std::uint64_t find(std::string_view path);

    // The places of all paths that start with this prefix, which is empty or
    // ends with '/'. Throws DamagedArchiveException.
    std::vector<NumberRange> startingWith(std::string_view prefix);

private:
    std::uint64_t firstPlaceAfter(std::uint32_t folder) const;

    const Segment& segment_;
    PathCursor paths_;
    PathBuffer buffer_;
    FolderDecoder folders_;
};

}  // namespace tessel::archive
