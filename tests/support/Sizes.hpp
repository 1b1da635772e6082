#pragma once

#include <cstddef>

namespace support {

// How much of a large test is run: all of it, or an eighth where a sanitizer or
// the counting of coverage makes each step take many times as long.
constexpr std::size_t shareOf(std::size_t count) {
#ifdef QZTESSEL_SLOWED
    return (count + 7) / 8;
#else
    return count;
#endif
}

}  // namespace support
