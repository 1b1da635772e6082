#pragma once

#include <bit>
#include <cstdint>
#include <cstring>

namespace tessel::archive {

// Loads of unsigned integers from any address, aligned or not. The stored
// byte order is fixed, whatever the machine's.

template <class Integer>
inline Integer loadLittle(const std::uint8_t* bytes) noexcept {
    static_assert(std::endian::native == std::endian::little ||
                  std::endian::native == std::endian::big);
    Integer value = 0;
    std::memcpy(&value, bytes, sizeof value);
    if constexpr (std::endian::native == std::endian::big) {
        if constexpr (sizeof value == 2) return __builtin_bswap16(value);
        if constexpr (sizeof value == 4) return __builtin_bswap32(value);
        if constexpr (sizeof value == 8) return __builtin_bswap64(value);
    }
    return value;
}

// Each bit load below yields at least this many bits of the stream.
constexpr unsigned bitsPerLoad = 57;

// The bits of a stream from `bit` on, the first as the most significant. At
// least bitsPerLoad of them come from the stream; zeros follow. Reads the 8
// bytes from bit / 8 on, which must be there.
inline std::uint64_t loadBits(const std::uint8_t* stream,
                              std::uint64_t bit) noexcept {
    std::uint64_t word = 0;
    std::memcpy(&word, stream + (bit >> 3), sizeof word);
    if constexpr (std::endian::native == std::endian::little)
        word = __builtin_bswap64(word);
    return word << (bit & 7);
}

}  // namespace tessel::archive
