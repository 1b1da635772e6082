#pragma once

#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

namespace tessel::archive {

// Appends numbers of a few bits each to a byte vector, most significant bit
// first. It owns the bytes until `take`.
class BitWriter {
public:
    // `value` must be below 2^bits; bits is at most 32.
    void put(std::uint32_t value, unsigned bits) {
        pending_ = pending_ << bits | value;
        pendingBits_ += bits;
        if (pendingBits_ >= 32) flushWord();
    }

    // Fills the last byte with zeros. Afterwards, bytes() is exact.
    void align() {
        if (pendingBits_ % 8 != 0) put(0, 8 - pendingBits_ % 8);
        while (pendingBits_ > 0) {
            pendingBits_ -= 8;
            append(static_cast<std::uint8_t>(pending_ >> pendingBits_));
        }
    }

    // Whole bytes so far. Call align() first.
    std::size_t bytes() const noexcept { return size_; }

    // The aligned bytes. The writer is empty afterwards.
    std::vector<std::uint8_t> take() {
        align();
        bytes_.resize(size_);
        size_ = 0;
        return std::exchange(bytes_, {});
    }

private:
    void flushWord() {
        pendingBits_ -= 32;
        const auto word = static_cast<std::uint32_t>(pending_ >> pendingBits_);
        if (size_ + 4 > bytes_.size()) grow();
        std::uint8_t* out = bytes_.data() + size_;
        out[0] = static_cast<std::uint8_t>(word >> 24U);
        out[1] = static_cast<std::uint8_t>(word >> 16U);
        out[2] = static_cast<std::uint8_t>(word >> 8U);
        out[3] = static_cast<std::uint8_t>(word);
        size_ += 4;
    }

    void append(std::uint8_t byte) {
        if (size_ == bytes_.size()) grow();
        bytes_[size_++] = byte;
    }

    // Makes room for at least four bytes more.
    void grow();

    std::vector<std::uint8_t> bytes_;  // grown ahead of size_
    std::size_t size_ = 0;
    std::uint64_t pending_ = 0;  // the lowest pendingBits_ bits count
    unsigned pendingBits_ = 0;   // below 32 between calls
};

}  // namespace tessel::archive
