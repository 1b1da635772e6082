#pragma once

#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

#include "archive/ArchiveReader.hpp"
#include "archive/NumberRange.hpp"

namespace tessel::archive {

// From paths to numbers, over all segments of an archive. Each function throws
// DamagedArchiveException.

// The lowest number of this path, if there is any.
std::optional<std::uint64_t> numberOf(const ArchiveReader& archive,
                                      std::string_view path);

// The numbers of all paths that start with the path and a '/', which may be
// the path's last byte; of all paths if it is empty.
std::vector<NumberRange> numbersBelow(const ArchiveReader& archive,
                                      std::string_view folder);

}  // namespace tessel::archive
