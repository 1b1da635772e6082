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

// Bytes taken by an integer of this width. Throws
// InvalidUintConversionException on an unknown width.
constexpr std::size_t widthBytes(PackedSizeT width) {
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

// The integer whose bytes these are, least significant first. At most 8.
constexpr std::uint64_t fromLittleEndian(
    std::span<const std::uint8_t> bytes) noexcept {
    std::uint64_t value = 0;
    for (std::size_t j = bytes.size(); j-- > 0;)
        value = (value << 8) | bytes[j];
    return value;
}

// Makes bytes for a ByteCursor, a block at a time, so that they need not all
// be in memory.
class ByteSource {
public:
    ByteSource() = default;
    ByteSource(const ByteSource&) = delete;
    ByteSource& operator=(const ByteSource&) = delete;
    virtual ~ByteSource() = default;

    // Bytes beyond the blocks that were made.
    virtual std::size_t remaining() const noexcept = 0;

    // The next block, of at least `size` bytes. It begins with `rest`, the
    // end of the block before, which is no longer valid then. Throws
    // DamagedFormException if there are fewer bytes.
    virtual std::span<const std::uint8_t> nextBlock(
        std::span<const std::uint8_t> rest, std::uint64_t size) = 0;
};

// The one bounded reader of outside bytes. It borrows the bytes or their
// source, which must outlive it, and only moves forward. A read that asks for
// more than is left throws DamagedFormException and leaves the cursor where it
// was.
//
// A cursor over a source has three more rules: what take returned is valid only
// until the next read; once a cursor was copied, read only the copy or only the
// original; read neither after the source has thrown.
//
// Inline: reading a stored form is a long row of these calls.
class ByteCursor {
public:
    explicit ByteCursor(std::span<const std::uint8_t> bytes) noexcept
        : rest_(bytes) {}
    explicit ByteCursor(ByteSource& source) noexcept : source_(&source) {}

    bool empty() const noexcept { return remaining() == 0; }
    std::size_t remaining() const noexcept {
        return rest_.size() + (source_ == nullptr ? 0 : source_->remaining());
    }

    // The next n bytes; advances past them.
    // The only place where an outside length meets the end of the data.
    std::span<const std::uint8_t> take(std::uint64_t n) {
        if (n > rest_.size()) fetch(n);
        const auto head = rest_.first(static_cast<std::size_t>(n));
        rest_ = rest_.subspan(static_cast<std::size_t>(n));
        return head;
    }

    // The next byte; advances past it.
    std::uint8_t takeByte() { return take(1).front(); }

    // The next integer of the given width; advances past it. Throws
    // InvalidUintConversionException on an unknown width.
    std::uint64_t takeUint(PackedSizeT width) {
        return fromLittleEndian(take(widthBytes(width)));
    }

    // Throws DamagedFormException unless `count` items of at least
    // `bytesEach` (not 0) bytes can still follow. Call it before reserving
    // memory for a count that was read.
    void requireItems(std::uint64_t count, std::size_t bytesEach) const {
        if (count > remaining() / bytesEach) throw DamagedFormException();
    }

private:
    // Has the source make more until n bytes are there.
    void fetch(std::uint64_t n);

    std::span<const std::uint8_t> rest_;
    ByteSource* source_ = nullptr;
};

}  // namespace sixpacks

using sixpacks::InvalidUintConversionException;

}  // namespace tessel
