#include "packing/sixpacks.hpp"

#include <zlib.h>

#include <utility>

namespace tessel::sixpacks {

namespace {

constexpr int compressionLevel = 9;

// The next n bytes, which the caller vouches for; advances `it` past them.
ByteCursor takeTrusted(ByteIterator& it, std::uint64_t n) {
    if (n == 0) return ByteCursor({});
    const std::span<const std::uint8_t> bytes(&*it,
                                              static_cast<std::size_t>(n));
    it += static_cast<std::ptrdiff_t>(n);
    return ByteCursor(bytes);
}

}  // namespace

void appendLittleEndian(std::uint64_t value, std::size_t byteCount,
                        std::vector<std::uint8_t>& out) {
    for (std::size_t j = 0; j < byteCount; ++j)
        out.push_back(static_cast<std::uint8_t>(value >> (8 * j)));
}

void packUint(std::uint64_t value, PackedSizeT width,
              std::vector<std::uint8_t>& out) {
    appendLittleEndian(value, widthBytes(width), out);
}

template <class UintT, class ValueT>
void PackerUnpackerUint<UintT, ValueT>::packValues(
    std::vector<ValueT> values, std::vector<std::uint8_t>& out) {
    for (const ValueT value : values) this->packValue(value, out);
}

template <class UintT, class ValueT>
void PackerUnpackerUint<UintT, ValueT>::packValue(
    ValueT value, std::vector<std::uint8_t>& out) {
    appendLittleEndian(value, sizeof(UintT), out);
}

template <class UintT, class ValueT>
void PackerUnpackerUint<UintT, ValueT>::unpackValues(std::vector<ValueT>& out,
                                                     ByteIterator& it,
                                                     const std::size_t& count) {
    for (std::size_t i = 0; i < count; ++i) {
        ValueT value = 0;
        this->unpackValue(value, it);
        out.push_back(value);
    }
}

template <class UintT, class ValueT>
void PackerUnpackerUint<UintT, ValueT>::unpackValue(ValueT& value,
                                                    ByteIterator& it) {
    value =
        fromLittleEndian(takeTrusted(it, sizeof(UintT)).take(sizeof(UintT)));
}

template class PackerUnpackerUint<std::uint8_t>;
template class PackerUnpackerUint<std::uint16_t>;
template class PackerUnpackerUint<std::uint32_t>;
template class PackerUnpackerUint<std::uint64_t>;

std::unique_ptr<PackerUnpackerBase<std::size_t>> makePackerUnpacker(
    PackedSizeT width) {
    switch (width) {
        case PackedSizeT::Uint8:
            return std::make_unique<PackerUnpackerUint<std::uint8_t>>();
        case PackedSizeT::Uint16:
            return std::make_unique<PackerUnpackerUint<std::uint16_t>>();
        case PackedSizeT::Uint32:
            return std::make_unique<PackerUnpackerUint<std::uint32_t>>();
        case PackedSizeT::Uint64:
            return std::make_unique<PackerUnpackerUint<std::uint64_t>>();
    }
    throw InvalidUintConversionException();
}

PackedSizeT narrowestWidth(std::size_t n) noexcept {
    if (n <= 0xFF) return PackedSizeT::Uint8;
    if (n <= 0xFFFF) return PackedSizeT::Uint16;
    if (n <= 0xFFFFFFFF) return PackedSizeT::Uint32;
    return PackedSizeT::Uint64;
}

PackedSizeT packPackedSizeT(std::size_t n, std::vector<std::uint8_t>& out) {
    const PackedSizeT width = narrowestWidth(n);
    out.push_back(static_cast<std::uint8_t>(width));
    return width;
}

void packSizeTVector(const std::vector<std::size_t>& values,
                     std::vector<std::uint8_t>& out, PackedSizeT valueSize,
                     PackedSizeT countSize) {
    packUint(values.size(), countSize, out);
    const std::size_t bytesEach = widthBytes(valueSize);
    for (const std::size_t value : values)
        appendLittleEndian(value, bytesEach, out);
}

void unpackSizeTVector(std::vector<std::size_t>& out, ByteIterator& it,
                       PackedSizeT valueSize, PackedSizeT countSize) {
    ByteCursor cursor = takeTrusted(it, widthBytes(countSize));
    const std::uint64_t count = cursor.takeUint(countSize);
    const std::size_t bytesEach = widthBytes(valueSize);
    cursor = takeTrusted(it, count * bytesEach);
    for (std::uint64_t i = 0; i < count; ++i)
        out.push_back(fromLittleEndian(cursor.take(bytesEach)));
}

void unpackSizeTVector(std::vector<std::size_t>& out, ByteCursor& cursor,
                       PackedSizeT valueSize, PackedSizeT countSize) {
    const std::uint64_t count = cursor.takeUint(countSize);
    const std::size_t bytesEach = widthBytes(valueSize);
    cursor.requireItems(count, bytesEach);
    out.reserve(out.size() + static_cast<std::size_t>(count));
    for (std::uint64_t i = 0; i < count; ++i)
        out.push_back(fromLittleEndian(cursor.take(bytesEach)));
}

void boolVecToBytes(std::vector<std::uint8_t>& out,
                    const std::vector<bool>& bits) {
    if (bits.empty()) return;
    std::uint8_t count = 0;
    unsigned acc = 0;
    for (const bool bit : bits) {
        if (bit) acc |= 1U << count;
        if (++count == 8) {
            out.push_back(static_cast<std::uint8_t>(acc));
            acc = 0;
            count = 0;
        }
    }
    out.push_back(static_cast<std::uint8_t>(acc));
    out.push_back(count);
}

void bytesToBoolVec(const std::vector<std::uint8_t>& bytes,
                    std::vector<bool>& out) {
    if (bytes.size() == 1) return;
    if (bytes.empty() || bytes.back() > 8) throw DamagedFormException();
    const std::size_t last = bytes.size() - 2;
    for (std::size_t i = 0; i <= last; ++i) {
        const unsigned count = i == last ? bytes.back() : 8;
        for (unsigned k = 0; k < count; ++k)
            out.push_back(((bytes[i] >> k) & 1U) != 0);
    }
}

void packVector(std::vector<std::uint8_t>& data, std::vector<std::uint8_t>& out,
                PackedSizeT lengthSize) {
    packUint(data.size(), lengthSize, out);
    out.insert(out.end(), data.begin(), data.end());
}

void unpackVector(std::vector<std::uint8_t>& out, ByteIterator& it,
                  PackedSizeT lengthSize) {
    ByteCursor cursor = takeTrusted(it, widthBytes(lengthSize));
    const std::uint64_t length = cursor.takeUint(lengthSize);
    const auto end = it + static_cast<std::ptrdiff_t>(length);
    out.insert(out.end(), it, end);
    it = end;
}

std::span<const std::uint8_t> unpackVector(ByteCursor& cursor,
                                           PackedSizeT lengthSize) {
    return cursor.take(cursor.takeUint(lengthSize));
}

void appendCompressed(std::span<const std::uint8_t> data,
                      std::vector<std::uint8_t>& out) {
    const std::size_t before = out.size();
    uLongf length = compressBound(data.size());
    out.resize(before + length);
    const int status = compress2(out.data() + before, &length, data.data(),
                                 data.size(), compressionLevel);
    // The buffer is large enough by construction, so only memory can be
    // missing.
    out.resize(before + (status == Z_OK ? length : 0));
    if (status != Z_OK) throw std::bad_alloc();
}

std::vector<std::uint8_t> compressUint8(std::vector<std::uint8_t>& data) {
    std::vector<std::uint8_t> stream;
    appendCompressed(data, stream);
    return stream;
}

std::vector<std::uint8_t> decompressUint8(ByteIterator begin,
                                          std::size_t compressedSize,
                                          std::size_t uncompressedSize) {
    std::vector<std::uint8_t> result(uncompressedSize);
    uLongf length = uncompressedSize;
    const std::uint8_t* stream = compressedSize == 0 ? nullptr : &*begin;
    uncompress(result.data(), &length, stream, compressedSize);
    result.resize(length);
    return result;
}

}  // namespace tessel::sixpacks
