#include "packing/Inflater.hpp"

#include <algorithm>
#include <limits>
#include <new>

namespace tessel::sixpacks {

namespace {

// Deflate's best case is a 258-byte match in two bits, so no stream grows by
// more than this factor.
constexpr std::uint64_t maxInflationFactor = 1032;

constexpr std::size_t windowBytes = std::size_t{64} << 10U;

// As many of so many bytes as zlib takes at once.
uInt zlibCount(std::size_t bytes) noexcept {
    return static_cast<uInt>(
        std::min<std::size_t>(bytes, std::numeric_limits<uInt>::max()));
}

}  // namespace

Inflater::Inflater(std::span<const std::uint8_t> stream, std::uint64_t size)
    : stream_(stream), toInflate_(static_cast<std::size_t>(size)) {
    if (size / maxInflationFactor > stream.size()) throw DamagedFormException();
    // One byte at least: zlib wants an address, also where nothing is to go.
    window_.resize(std::clamp<std::size_t>(toInflate_, 1, windowBytes));
    if (inflateInit(&zlib_) != Z_OK) throw std::bad_alloc();
}

Inflater::~Inflater() { inflateEnd(&zlib_); }

std::span<const std::uint8_t> Inflater::nextBlock(
    std::span<const std::uint8_t> rest, std::uint64_t size) {
    if (size > window_.size()) {
        std::vector<std::uint8_t> larger(static_cast<std::size_t>(size));
        std::ranges::copy(rest, larger.begin());
        window_.swap(larger);
    } else {
        std::ranges::copy(rest, window_.begin());
    }
    const auto room = std::span(window_).subspan(rest.size());
    const std::size_t count = std::min(room.size(), toInflate_);
    fill(room.first(count));
    return std::span(window_).first(rest.size() + count);
}

void Inflater::finish() {
    const std::span<std::uint8_t> window(window_);
    while (toInflate_ > 0)
        fill(window.first(std::min(window.size(), toInflate_)));
    // The checksum, and maybe blocks of no bytes before it.
    while (!hasEnded_) inflateSome(window.first(0));
}

// Inflates as many bytes as fit in `to`.
void Inflater::fill(std::span<std::uint8_t> to) {
    while (!to.empty()) {
        if (hasEnded_) throw DamagedFormException();
        to = to.subspan(inflateSome(to));
    }
}

// Inflates up to so many bytes and returns how many. Each call makes headway
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
