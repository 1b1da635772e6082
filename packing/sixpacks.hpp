#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

#include "packing/ByteCursor.hpp"

// Primitives of the stored form: unsigned integers at four widths, bit and
// byte blocks, and zlib compression.
//
// Every multi-byte integer is little-endian, whatever the machine. A `pack`
// function appends to a vector that it never clears; the matching `unpack`
// function appends what it reads and advances a read position.
//
// Each reader exists twice:
//
//   reads from          | checks                  | for
//   --------------------+-------------------------+-------------------------
//   ByteCursor          | each length against     | bytes from outside
//                       | what is left            |
//   a vector's iterator | nothing: it cannot know | bytes that this process
//                       | where the data ends     | wrote; inspection only
namespace tessel::sixpacks {

using ByteIterator = std::vector<std::uint8_t>::const_iterator;

// ---- Integers ----

// Appends the low `byteCount` bytes of the value, at most 8, least
// significant first: the counterpart of fromLittleEndian.
void appendLittleEndian(std::uint64_t value, std::size_t byteCount,
                        std::vector<std::uint8_t>& out);

// Appends the value at the given width; high bytes that do not fit are lost
// silently. Throws InvalidUintConversionException on an unknown width, with
// nothing appended.
void packUint(std::uint64_t value, PackedSizeT width,
              std::vector<std::uint8_t>& out);

// Inspection: the stored forms use packUint and ByteCursor.
// Packs and unpacks integers of one width. ValueT is std::size_t.
template <class ValueT>
class PackerUnpackerBase {
public:
    virtual ~PackerUnpackerBase() = default;

    // Appends every value in order.
    virtual void packValues(std::vector<ValueT> values,
                            std::vector<std::uint8_t>& out) = 0;

    // Appends the value's low bytes; high bytes that do not fit are lost
    // silently.
    virtual void packValue(ValueT value, std::vector<std::uint8_t>& out) = 0;

    // Appends `count` values read at `it` and advances it. Trusts the data.
    virtual void unpackValues(std::vector<ValueT>& out, ByteIterator& it,
                              const std::size_t& count) = 0;

    // Reads one value at `it` and advances it. Trusts the data.
    virtual void unpackValue(ValueT& value, ByteIterator& it) = 0;
};

// The packer for the width of UintT.
template <class UintT, class ValueT = std::size_t>
class PackerUnpackerUint : public PackerUnpackerBase<ValueT> {
public:
    void packValues(std::vector<ValueT> values,
                    std::vector<std::uint8_t>& out) override;
    void packValue(ValueT value, std::vector<std::uint8_t>& out) override;
    void unpackValues(std::vector<ValueT>& out, ByteIterator& it,
                      const std::size_t& count) override;
    void unpackValue(ValueT& value, ByteIterator& it) override;
};

extern template class PackerUnpackerUint<std::uint8_t>;
extern template class PackerUnpackerUint<std::uint16_t>;
extern template class PackerUnpackerUint<std::uint32_t>;
extern template class PackerUnpackerUint<std::uint64_t>;

// A new packer for the width. Throws InvalidUintConversionException on an
// unknown one.
std::unique_ptr<PackerUnpackerBase<std::size_t>> makePackerUnpacker(
    PackedSizeT width);

// The narrowest width that holds n: up to 255, 65535, 4294967295, or more.
PackedSizeT narrowestWidth(std::size_t n) noexcept;

// Appends the one-byte code of the narrowest width that holds n and returns
// that width.
PackedSizeT packPackedSizeT(std::size_t n, std::vector<std::uint8_t>& out);

// Appends values.size() in countSize bytes, then each value in valueSize
// bytes. Neither width is stored: give the reader both.
//
// valueSize  must fit the largest value; one that does not fit loses its
//            high bytes silently. countSize likewise.
// Throws InvalidUintConversionException on an unknown width. If valueSize is
// the bad one, the count is already in out.
void packSizeTVector(const std::vector<std::size_t>& values,
                     std::vector<std::uint8_t>& out, PackedSizeT valueSize,
                     PackedSizeT countSize);

// Appends to out the values that packSizeTVector wrote and advances `it`
// past them. Trusts the data. Throws InvalidUintConversionException on an
// unknown width; if valueSize is the bad one, the count is already consumed.
void unpackSizeTVector(std::vector<std::size_t>& out, ByteIterator& it,
                       PackedSizeT valueSize, PackedSizeT countSize);

// The same for outside bytes. Throws DamagedFormException before anything is
// appended or reserved if the values do not fit in what is left.
void unpackSizeTVector(std::vector<std::size_t>& out, ByteCursor& cursor,
                       PackedSizeT valueSize, PackedSizeT countSize);

// ---- Bit and byte blocks ----

// Appends a bit block: nothing for no bits; otherwise
//
//   | floor(n / 8) bytes | 1 byte            | 1 byte    |
//   | full bytes         | last n mod 8 bits | n mod 8   |
//
// Bit i is in byte i / 8 at position i mod 8, least significant first.
// Unused bits are 0. The middle byte is there (as 0) when n mod 8 is 0.
void boolVecToBytes(std::vector<std::uint8_t>& out,
                    const std::vector<bool>& bits);

// Appends the bits of one bit block, which must be the whole of `bytes`.
//
//   bytes        | appended
//   -------------+--------------------------------------------------
//   none         | throws DamagedFormException
//   one          | nothing, whatever the byte is
//   two or more  | the bits; throws DamagedFormException, with nothing
//                | appended, when the last byte is above 8
void bytesToBoolVec(const std::vector<std::uint8_t>& bytes,
                    std::vector<bool>& out);

// Appends data.size() in lengthSize bytes, then the bytes. `data` is not
// changed. The width is not stored, and a size that does not fit it is cut
// silently. Throws InvalidUintConversionException on an unknown width, with
// nothing appended.
void packVector(std::vector<std::uint8_t>& data, std::vector<std::uint8_t>& out,
                PackedSizeT lengthSize);

// Appends to out the bytes of one block written by packVector and advances
// `it` past it. Trusts the data. Throws InvalidUintConversionException on an
// unknown width.
void unpackVector(std::vector<std::uint8_t>& out, ByteIterator& it,
                  PackedSizeT lengthSize);

// The same for outside bytes, without a copy: the block's bytes inside the
// cursor's data. Throws DamagedFormException if they do not fit in what is
// left.
std::span<const std::uint8_t> unpackVector(ByteCursor& cursor,
                                           PackedSizeT lengthSize);

// ---- Compression ----

// A zlib stream (RFC 1950) of data at level 9. `data` is not changed. Neither
// length is stored. Cost: slow on purpose; the worst case needs as much
// memory again as the data. Throws std::bad_alloc.
std::vector<std::uint8_t> compressUint8(std::vector<std::uint8_t>& data);

// Appends the same stream to `out`, which must be another vector than the
// data, without a buffer of its own. If it throws (std::bad_alloc), nothing
// is appended.
void appendCompressed(std::span<const std::uint8_t> data,
                      std::vector<std::uint8_t>& out);

// What zlib can get out of the stream at `begin`: at most uncompressedSize
// bytes, fewer when the stream is damaged or shorter. Errors are not
// reported, and uncompressedSize bytes are allocated first: not for outside
// bytes.
std::vector<std::uint8_t> decompressUint8(ByteIterator begin,
                                          std::size_t compressedSize,
                                          std::size_t uncompressedSize);

}  // namespace tessel::sixpacks
