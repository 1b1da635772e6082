#pragma once

#include <cstddef>
#include <cstdint>
#include <exception>
#include <span>

namespace tessel {

// A stored form ends too early, claims more than it holds, or holds
// something that no writer produces.
class DamagedFormException : public std::exception {
public:
    const char* what() const noexcept override;
};

namespace sixpacks {

// An unknown width code was used as a width.
class InvalidUintConversionException : public std::exception {
public:
    const char* what() const noexcept override;
};

// Width of a stored unsigned integer: 1, 2, 4 or 8 bytes.
// Stored as one byte. Never renumber: written forms hold these values.
enum class PackedSizeT : std::uint8_t {
    Uint8 = 0,
    Uint16 = 1,
    Uint32 = 2,
    Uint64 = 3
};

// The integer whose bytes these are, least significant first. At most 8.
std::uint64_t fromLittleEndian(std::span<const std::uint8_t> bytes) noexcept;

// The one bounded reader of outside bytes. It borrows the bytes, which must
// outlive it, and only moves forward. A read that asks for more than is left
// throws DamagedFormException and leaves the cursor where it was.
class ByteCursor {
public:
    explicit ByteCursor(std::span<const std::uint8_t> bytes) noexcept
        : rest_(bytes) {}

    bool empty() const noexcept { return rest_.empty(); }
    std::size_t remaining() const noexcept { return rest_.size(); }

    // The next n bytes; advances past them.
    std::span<const std::uint8_t> take(std::uint64_t n);

    // The next byte; advances past it.
    std::uint8_t takeByte() { return take(1).front(); }

    // The next integer of the given width; advances past it. Throws
    // InvalidUintConversionException on an unknown width.
    std::uint64_t takeUint(PackedSizeT width);

    // Throws DamagedFormException unless `count` items of at least
    // `bytesEach` (not 0) bytes can still follow. Call it before reserving
    // memory for a count that was read.
    void requireItems(std::uint64_t count, std::size_t bytesEach) const;

private:
    std::span<const std::uint8_t> rest_;
};

// Bytes taken by an integer of this width. Throws
// InvalidUintConversionException on an unknown width.
std::size_t widthBytes(PackedSizeT width);

}  // namespace sixpacks

using sixpacks::InvalidUintConversionException;

}  // namespace tessel
