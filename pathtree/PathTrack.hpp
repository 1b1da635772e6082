#pragma once

#include <cstdint>
#include <vector>

namespace tessel {

// A path track: child positions from the root of the path tree down.
using PathTrack = std::vector<std::uint64_t>;

}  // namespace tessel
