#include "hosts/python/KeyedPermutation.hpp"

#include <algorithm>
#include <bit>

namespace tessel::python {

namespace {

constexpr std::uint64_t goldenRatio = 0x9E3779B97F4A7C15;

// SplitMix64's finalizer: each bit of the input changes half of the output's.
std::uint64_t mixed(std::uint64_t value) noexcept {
    value = (value ^ value >> 30U) * 0xBF58476D1CE4E5B9;
    value = (value ^ value >> 27U) * 0x94D049BB133111EB;
    return value ^ value >> 31U;
}

// Bits that hold all numbers below size, at least one per half.
unsigned bitsFor(std::uint64_t size) noexcept {
    const std::uint64_t last = size == 0 ? 0 : size - 1;
    return std::max(2U, static_cast<unsigned>(std::bit_width(last)));
}

std::uint64_t maskOf(unsigned bits) noexcept {
    return (std::uint64_t{1} << bits) - 1;
}

}  // namespace

KeyedPermutation::KeyedPermutation(std::uint64_t size,
                                   std::uint64_t key) noexcept
    : size_(size),
      key_(key),
      lowBits_(bitsFor(size) / 2),
      lowMask_(maskOf(lowBits_)),
      highMask_(maskOf(bitsFor(size) - lowBits_)) {
    for (std::size_t i = 0; i < rounds; ++i)
        roundKeys_[i] = mixed(key + goldenRatio * (i + 1));
}

std::uint64_t KeyedPermutation::operator[](std::uint64_t index) const noexcept {
    std::uint64_t number = forward(index);
    while (number >= size_) number = forward(number);
    return number;
}

std::uint64_t KeyedPermutation::indexOf(std::uint64_t number) const noexcept {
    std::uint64_t index = backward(number);
    while (index >= size_) index = backward(index);
    return index;
}

std::uint64_t KeyedPermutation::forward(std::uint64_t number) const noexcept {
    std::uint64_t low = number & lowMask_;
    std::uint64_t high = number >> lowBits_;
    for (std::size_t i = 0; i < rounds; i += 2) {
        high ^= mixed(low ^ roundKeys_[i]) & highMask_;
        low ^= mixed(high ^ roundKeys_[i + 1]) & lowMask_;
    }
    return high << lowBits_ | low;
}

std::uint64_t KeyedPermutation::backward(std::uint64_t number) const noexcept {
    std::uint64_t low = number & lowMask_;
    std::uint64_t high = number >> lowBits_;
    for (std::size_t i = rounds; i > 0; i -= 2) {
        low ^= mixed(high ^ roundKeys_[i - 1]) & lowMask_;
        high ^= mixed(low ^ roundKeys_[i - 2]) & highMask_;
    }
    return high << lowBits_ | low;
}

}  // namespace tessel::python
