#include "archive/PieceDecoder.hpp"

#include <bit>

namespace tessel::archive {

unsigned PieceDecoder::takeLongPrefix(Position& at) const {
    // A component has at most 2^20 bytes, so at most 20 zeros lead.
    constexpr unsigned maxZeros = 20;
    const std::uint64_t bits = word(at);
    const auto zeros = static_cast<unsigned>(std::countl_zero(bits));
    if (zeros > maxZeros) fail(at, "A shared prefix is too long.");
    const unsigned length = 2 * zeros + 1;
    at.bit += length;
    return maxShortPrefix + static_cast<unsigned>(bits >> (64 - length));
}

}  // namespace tessel::archive
