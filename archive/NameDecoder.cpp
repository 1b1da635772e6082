#include "archive/NameDecoder.hpp"

namespace tessel::archive {

// By value, so that the caller's position stays in registers.
NameDecoder::Position NameDecoder::takeRareOperation(Position at,
                                                     unsigned symbol,
                                                     unsigned& prefix) {
    prefix = 0;
    switch (symbol) {
        case operationLongPrefix:
            prefix = takeLongPrefix(at);
            if (prefix > length_)
                fail(at, "A name shares more than its predecessor has.");
            break;
        case operationNextFolder:
            takeNextFolder(at);
            break;
        case operationJump:
            takeJump(at);
            break;
        default:
            fail(at, "An operation has no code.");
    }
    previous_ = symbol;
    context_ = operationContexts[symbol];
    return at;
}

void NameDecoder::takeNextFolder(const Position& at) {
    if (seen_ >= head().folders)
        fail(at, "A name is in a folder after the last one.");
    folder_ = seen_++;
}

void NameDecoder::takeJump(Position& at) {
    // A distance is at most the number of folders, which is below 2^23.
    constexpr unsigned maxDistanceBits = 23;
    std::uint64_t bits = word(at);
    const auto [width, widthBits] =
        tables().operationCode(jumpCode).decode(bits);
    if (width > maxDistanceBits) fail(at, "A jump is too long.");
    bits <<= widthBits;
    at.bit += widthBits + width;
    const std::uint64_t rest = width == 0 ? 0 : bits >> (64 - width);
    const std::uint64_t distance = (std::uint64_t{1} << width) + rest;
    if (distance > seen_) fail(at, "A jump leads before the first folder.");
    folder_ = seen_ - static_cast<std::uint32_t>(distance);
}

}  // namespace tessel::archive
