#pragma once

#include <array>
#include <cstddef>
#include <cstdint>

namespace tessel::python {

// KeyedPermutation is an order of the numbers below `size` that looks random
// and depends on a key alone: it is computed per number, without an array, and
// is the same on every machine.
//
// It is a Feistel network (Luby and Rackoff 1988) on as few bits as hold all
// the numbers. A result that is too large is put in again until it fits, which
// keeps the whole a permutation (cycle walking; Black and Rogaway, "Ciphers
// with Arbitrary Finite Domains", 2002). The round function is the finalizer
// of SplitMix64 (Steele, Lea and Flood, "Fast Splittable Pseudorandom Number
// Generators", 2014). It shuffles; it does not keep secrets.
//
// Never change what it computes: lists that were shuffled with a seed have to
// stay in their order.
//
// Threads: immutable.
// Cost: at most two passes of the network on average, four below size 4. A
//   pass takes some 15 ns.
class KeyedPermutation {
public:
    KeyedPermutation(std::uint64_t size, std::uint64_t key) noexcept;

    std::uint64_t size() const noexcept { return size_; }
    std::uint64_t key() const noexcept { return key_; }

    // The number at this index. Both are below size().
    std::uint64_t operator[](std::uint64_t index) const noexcept;

    // The index of this number: the inverse.
    std::uint64_t indexOf(std::uint64_t number) const noexcept;

private:
    // Even, because each pair of rounds changes both halves.
    static constexpr std::size_t rounds = 8;

    std::uint64_t forward(std::uint64_t number) const noexcept;
    std::uint64_t backward(std::uint64_t number) const noexcept;

    std::uint64_t size_;
    std::uint64_t key_;
    unsigned lowBits_;
    std::uint64_t lowMask_;
    std::uint64_t highMask_;
    std::array<std::uint64_t, rounds> roundKeys_{};
};

}  // namespace tessel::python
