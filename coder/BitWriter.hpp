#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "coder/CodeTable.hpp"

namespace tessel {

// Writes codes to bytes as a bit block (sixpacks::boolVecToBytes): least
// significant bit first, without a branch.
//
// Ownership: borrows the bytes. May write `slack` more than the block has.
class BitWriter {
public:
    static constexpr unsigned bitsPerByte = 8;
    // Bytes that may be touched after the block.
    static constexpr std::size_t slack = 7;

    // Size of the block that holds this many bits.
    static constexpr std::size_t blockBytes(std::size_t bits) noexcept {
        return bits == 0 ? 0 : bits / bitsPerByte + 2;
    }

    explicit BitWriter(std::uint8_t* to) noexcept : out_(to) {}

    // Appends the `count` (at most CodeTable::longestInline) low bits; all
    // higher bits must be 0.
    void put(std::uint64_t bits, unsigned count) noexcept {
        static_assert(std::endian::native == std::endian::little);
        static_assert(CodeTable::longestInline + bitsPerByte <= 64);
        held_ |= bits << heldBits_;
        heldBits_ += count;
        std::memcpy(out_, &held_, sizeof held_);
        out_ += heldBits_ / bitsPerByte;
        held_ >>= heldBits_ / bitsPerByte * bitsPerByte;
        heldBits_ %= bitsPerByte;
    }

    // Ends the block: the last bits, then how many they are. Returns its end.
    std::uint8_t* finish() noexcept {
        *out_++ = static_cast<std::uint8_t>(held_);
        *out_++ = static_cast<std::uint8_t>(heldBits_);
        return out_;
    }

private:
    std::uint8_t* out_;
    std::uint64_t held_ = 0;
    unsigned heldBits_ = 0;  // below bitsPerByte
};

}  // namespace tessel
