#include "pathtree/HashIndex.hpp"

// Compiled into this file alone; nothing to link.
#define XXH_INLINE_ALL
#include <xxhash.h>

#include <array>
#include <chrono>
#include <random>

namespace tessel {

namespace {

using Secret = std::array<std::uint32_t, XXH3_SECRET_DEFAULT_SIZE / 4>;

// Random bits from the system. Without any, the clock and the address of a
// variable, which differ per process, keep the library working; the names
// that collide are then easier to guess.
Secret newSecret() noexcept {
    Secret secret{};
    try {
        std::random_device source;
        for (std::uint32_t& word : secret) word = source();
    } catch (...) {
        const auto now =
            std::chrono::steady_clock::now().time_since_epoch().count();
        std::seed_seq seeds{static_cast<std::uint64_t>(now),
                            reinterpret_cast<std::uint64_t>(&secret)};
        seeds.generate(secret.begin(), secret.end());
    }
    return secret;
}

}  // namespace

std::uint32_t HashIndex::hashOf(ComponentView bytes) noexcept {
    static const Secret secret = newSecret();
    return static_cast<std::uint32_t>(XXH3_64bits_withSecret(
        bytes.data(), bytes.size(), secret.data(), sizeof secret));
}

}  // namespace tessel
