#include "packing/ByteCursor.hpp"

namespace tessel {

const char* DamagedFormException::what() const noexcept {
    return "The stored form is truncated or damaged.";
}

namespace sixpacks {

const char* InvalidUintConversionException::what() const noexcept {
    return "Invalid uint type conversion.";
}

std::uint64_t fromLittleEndian(std::span<const std::uint8_t> bytes) noexcept {
    std::uint64_t value = 0;
    for (std::size_t j = bytes.size(); j-- > 0;)
        value = (value << 8) | bytes[j];
    return value;
}

// The only place where an outside length meets the end of the data.
std::span<const std::uint8_t> ByteCursor::take(std::uint64_t n) {
    if (n > rest_.size()) throw DamagedFormException();
    const auto head = rest_.first(static_cast<std::size_t>(n));
    rest_ = rest_.subspan(static_cast<std::size_t>(n));
    return head;
}

std::uint64_t ByteCursor::takeUint(PackedSizeT width) {
    return fromLittleEndian(take(widthBytes(width)));
}

void ByteCursor::requireItems(std::uint64_t count,
                              std::size_t bytesEach) const {
    if (count > rest_.size() / bytesEach) throw DamagedFormException();
}

std::size_t widthBytes(PackedSizeT width) {
    switch (width) {
        case PackedSizeT::Uint8:
            return sizeof(std::uint8_t);
        case PackedSizeT::Uint16:
            return sizeof(std::uint16_t);
        case PackedSizeT::Uint32:
            return sizeof(std::uint32_t);
        case PackedSizeT::Uint64:
            return sizeof(std::uint64_t);
    }
    throw InvalidUintConversionException();
}

}  // namespace sixpacks
}  // namespace tessel
