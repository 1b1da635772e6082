#include "packing/ByteCursor.hpp"

namespace tessel {

const char* DamagedFormException::what() const noexcept {
    return "The stored form is truncated or damaged.";
}

const char* sixpacks::InvalidUintConversionException::what() const noexcept {
    return "Invalid uint type conversion.";
}

}  // namespace tessel
