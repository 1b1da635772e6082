#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/NumberRange.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// From paths to numbers, over all segments of an archive. Each function throws
// DamagedArchiveException.

// The lowest number of this path, if there is any.
std::optional<std::uint64_t> numberOf(const ArchiveReader& archive,
                                      std::string_view path);

// Whether the path is in the list. Faster than numberOf in a rearranged segment
// without an index, where numberOf scans the order.
bool contains(const ArchiveReader& archive, std::string_view path);

// The numbers of all paths that start with the folder and a '/', which the
// folder may already end with; of all paths if the folder is empty.
std::vector<NumberRange> numbersBelow(const ArchiveReader& archive,
                                      std::string_view folder);

// The start of all paths below a folder: the folder with '/' at its end, or
// nothing for the whole list.
std::string prefixOf(std::string_view folder);

// The places of one segment's paths that start with such a prefix, counted
// from its first; ascending.
std::vector<NumberRange> placesBelow(const Segment& segment,
                                     std::string_view prefix);

}  // namespace tessel::archive
