#include "packing/Inflater.hpp"

#include <algorithm>
#include <limits>
#include <new>
#include <system_error>
#include <thread>

namespace tessel::sixpacks {

namespace {

// Deflate's best case is a 258-byte match in two bits, so no stream grows by
// more than this factor.
constexpr std::uint64_t maxInflationFactor = 1032;

constexpr std::size_t windowBytes = std::size_t{256} << 10U;

constexpr std::size_t usualHeadroom = std::size_t{4} << 10U;

// No more bytes than zlib takes in one call.
uInt zlibCount(std::size_t bytes) noexcept {
    return static_cast<uInt>(
        std::min<std::size_t>(bytes, std::numeric_limits<uInt>::max()));
}

// A thread pays only beside another core.
std::launch aheadOfReader() noexcept {
    return std::thread::hardware_concurrency() > 1 ? std::launch::async
                                                   : std::launch::deferred;
}

}  // namespace

Inflater::Inflater(std::span<const std::uint8_t> stream, std::uint64_t size)
    : headroom_(std::min<std::uint64_t>(
          usualHeadroom, size - std::min<std::uint64_t>(size, windowBytes))),
      unread_(static_cast<std::size_t>(size)),
      stream_(stream),
      toInflate_(unread_) {
    if (size / maxInflationFactor > stream.size()) throw DamagedFormException();
    if (inflateInit(&zlib_) != Z_OK) throw std::bad_alloc();
}

Inflater::~Inflater() {
    ahead_ = {};  // waits for the thread
    inflateEnd(&zlib_);
}

std::span<const std::uint8_t> Inflater::nextBlock(
    std::span<const std::uint8_t> rest, std::uint64_t size) {
    if (!ahead_.valid()) inflateAhead(std::launch::deferred);
    ahead_.get();
    const std::size_t count = rest.size() + aheadBytes_;
    const bool isLong = rest.size() > headroom_ || size > count;
    const auto block = isLong
                           ? longBlock(rest, std::max<std::size_t>(size, count))
                           : shortBlock(rest);
    unread_ -= block.size() - rest.size();
    if (unread_ > 0) inflateAhead(aheadOfReader());
    return block;
}

// The window that was inflated ahead, with the rest put in front of it.
std::span<const std::uint8_t> Inflater::shortBlock(
    std::span<const std::uint8_t> rest) {
    const std::size_t begin = headroom_ - rest.size();
    std::ranges::copy(rest, std::span(next_).subspan(begin).begin());
    window_.swap(next_);
    return std::span(window_).subspan(begin, rest.size() + aheadBytes_);
}

// A block of more than was inflated ahead, or with a long rest.
std::span<const std::uint8_t> Inflater::longBlock(
    std::span<const std::uint8_t> rest, std::size_t size) {
    std::vector<std::uint8_t> block(size);
    const auto ahead = std::span(next_).subspan(headroom_, aheadBytes_);
    const auto afterRest = std::ranges::copy(rest, block.begin()).out;
    const auto end = std::ranges::copy(ahead, afterRest).out;
    fill(std::span(end, block.end()));
    window_.swap(block);
    return window_;
}

void Inflater::finish() {
    if (ahead_.valid()) ahead_.get();
    while (toInflate_ > 0) fill(room());
    // The checksum, and maybe blocks of no bytes before it.
    while (!hasEnded_) inflateSome(room());
    unread_ = 0;
}

// Begins to inflate the next window into next_.
void Inflater::inflateAhead(std::launch how) {
    const auto inflateNext = [this, to = room()] { fill(to); };
    try {
        ahead_ = std::async(how, inflateNext);
    } catch (const std::system_error&) {
        ahead_ = std::async(std::launch::deferred, inflateNext);
    }
}

// The place in next_ for the next window. It has an address, which zlib wants,
// also if it is empty.
std::span<std::uint8_t> Inflater::room() {
    aheadBytes_ = std::min(windowBytes, toInflate_);
    const std::size_t needed =
        std::max<std::size_t>(headroom_ + aheadBytes_, 1);
    if (next_.size() < needed) next_.resize(needed);
    return std::span(next_).subspan(headroom_, aheadBytes_);
}

// Inflates as many bytes as fit in `to`.
void Inflater::fill(std::span<std::uint8_t> to) {
    while (!to.empty()) {
        if (hasEnded_) throw DamagedFormException();
        to = to.subspan(inflateSome(to));
    }
}

// Inflates up to this many bytes and returns how many. Each call makes headway
// or throws: zlib says so when it cannot go on, and keeps saying it.
std::size_t Inflater::inflateSome(std::span<std::uint8_t> to) {
    if (zlib_.avail_in == 0) {
        zlib_.next_in = const_cast<Bytef*>(stream_.data());
        zlib_.avail_in = zlibCount(stream_.size());
        stream_ = stream_.subspan(zlib_.avail_in);
    }
    const uInt room = zlibCount(to.size());
    zlib_.next_out = to.data();
    zlib_.avail_out = room;
    const int status = inflate(&zlib_, Z_NO_FLUSH);
    if (status == Z_MEM_ERROR) throw std::bad_alloc();
    if (status != Z_OK && status != Z_STREAM_END) throw DamagedFormException();
    hasEnded_ = status == Z_STREAM_END;
    const std::size_t count = room - zlib_.avail_out;
    toInflate_ -= count;
    return count;
}

}  // namespace tessel::sixpacks
