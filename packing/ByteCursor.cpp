#include "packing/ByteCursor.hpp"

namespace tessel {

const char* DamagedFormException::what() const noexcept {
    return "The stored form is truncated or damaged.";
}

const char* sixpacks::InvalidUintConversionException::what() const noexcept {
    return "Invalid uint type conversion.";
}

void sixpacks::ByteCursor::fetch(std::uint64_t n) {
    if (source_ == nullptr || n > remaining()) throw DamagedFormException();
    rest_ = source_->nextBlock(rest_, n);
}

}  // namespace tessel
