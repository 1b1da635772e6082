#pragma once

#include <zlib.h>

#include <cstddef>
#include <cstdint>
#include <future>
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
// Threads: one at a time may use it. If there is a second core, a thread of its
//   own inflates the next window while the current one is read.
// Cost: two windows of 256 KiB, or of the longest single read; about 40 KB
//   inside zlib.
class Inflater final : public ByteSource {
public:
    // Throws DamagedFormException, before memory is taken, if no zlib stream
    // of this length can reach the size: a stream of n bytes can demand
    // 1,032 n bytes, no more. Throws std::bad_alloc.
    Inflater(std::span<const std::uint8_t> stream, std::uint64_t size);
    ~Inflater() override;

    std::size_t remaining() const noexcept override { return unread_; }

    // Throws DamagedFormException if the stream is damaged or ends before
    // `size` bytes are there, and std::bad_alloc.
    std::span<const std::uint8_t> nextBlock(std::span<const std::uint8_t> rest,
                                            std::uint64_t size) override;

    // Inflates what nobody has read and drops it; the last block is no longer
    // valid. Throws DamagedFormException if there was anything wrong with the
    // stream, also if a read has thrown that before, and std::bad_alloc.
    void finish();

private:
    std::span<std::uint8_t> room();
    void inflateAhead(std::launch how);
    std::span<const std::uint8_t> shortBlock(
        std::span<const std::uint8_t> rest);
    std::span<const std::uint8_t> longBlock(std::span<const std::uint8_t> rest,
                                            std::size_t size);
    void fill(std::span<std::uint8_t> to);
    std::size_t inflateSome(std::span<std::uint8_t> to);

    // Room before a window, for the rest of the one before it. None if there is
    // one window only, which takes no more memory than its bytes then.
    const std::size_t headroom_;

    std::size_t unread_;                // bytes that are in no block yet
    std::size_t aheadBytes_ = 0;        // in next_, once ahead_ is ready
    std::vector<std::uint8_t> window_;  // the current block
    std::vector<std::uint8_t> next_;

    // Used by the thread that inflates ahead until ahead_ is ready.
    z_stream zlib_{};
    std::span<const std::uint8_t> stream_;  // what zlib has not been given
    std::size_t toInflate_;
    bool hasEnded_ = false;

    std::future<void> ahead_;
};

}  // namespace tessel::sixpacks
