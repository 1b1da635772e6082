#include "archive/NameDecoder.hpp"

namespace tessel::archive {

// Returns the prefix length.
unsigned NameDecoder::takeRareOperation(unsigned symbol) {
    unsigned prefix = 0;
    switch (symbol) {
        case operationLongPrefix:
            prefix = takeLongPrefix();
            if (prefix > length_)
                fail("A name shares more than its predecessor has.");
            break;
        case operationNextFolder:
            takeNextFolder();
            break;
        case operationJump:
            takeJump();
            break;
        default:
            fail("An operation has no code.");
    }
    previous_ = symbol;
    context_ = operationContexts[symbol];
    return prefix;
}

void NameDecoder::takeNextFolder() {
    if (seen_ >= segment_->head().folders)
        fail("A name is in a folder after the last one.");
    folder_ = seen_++;
}

void NameDecoder::takeJump() {
    // A distance is less than the number of folders, which is below 2^23.
    constexpr unsigned maxDistanceBits = 23;
    std::uint64_t bits = word();
    const auto [width, widthBits] =
        tables_->operationCode(jumpCode).decode(bits);
    if (width > maxDistanceBits) fail("A jump is too long.");
    bits <<= widthBits;
    bit_ += widthBits + width;
    const std::uint64_t rest = width == 0 ? 0 : bits >> (64 - width);
    const std::uint64_t distance = (std::uint64_t{1} << width) + rest;
    if (distance > seen_) fail("A jump leads before the first folder.");
    folder_ = seen_ - static_cast<std::uint32_t>(distance);
}

bool NameDecoder::isAtEnd() const noexcept {
    return bit_ <= end_ && end_ - bit_ < 8;
}

}  // namespace tessel::archive
