#pragma once

#include <zlib.h>

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "packing/ByteCursor.hpp"

namespace tessel::sixpacks {

// Inflater inflates a zlib stream (RFC 1950) from outside for a ByteCursor, a
// window at a time. The stream must be whole, undamaged and of exactly the
// size that was claimed for it; bytes behind it are ignored. All of that is
// known only after finish(), so keep apart until then what was read.
//
// Ownership: borrows the stream.
// Cost: a window of 64 KiB, or of the longest single read; about 40 KB inside
//   zlib.
class Inflater final : public ByteSource {
public:
    // Throws DamagedFormException, before memory is taken, if no zlib stream
    // of this length can reach the size: a stream of n bytes can demand
    // 1,032 n bytes, no more. Throws std::bad_alloc.
    Inflater(std::span<const std::uint8_t> stream, std::uint64_t size);
    ~Inflater() override;

    std::size_t remaining() const noexcept override { return toInflate_; }

    // Throws DamagedFormException if the stream is damaged or ends before
    // `size` bytes are there, and std::bad_alloc.
    std::span<const std::uint8_t> nextBlock(std::span<const std::uint8_t> rest,
                                            std::uint64_t size) override;

    // Inflates what nobody has read and drops it; the last block is no longer
    // valid. Throws DamagedFormException if there was anything wrong with the
    // stream, also if a read has thrown that before, and std::bad_alloc.
    void finish();

private:
    void fill(std::span<std::uint8_t> to);
    std::size_t inflateSome(std::span<std::uint8_t> to);

    z_stream zlib_{};
    std::span<const std::uint8_t> stream_;  // what zlib has not been given
    std::size_t toInflate_;
    bool hasEnded_ = false;
    std::vector<std::uint8_t> window_;
};

}  // namespace tessel::sixpacks
