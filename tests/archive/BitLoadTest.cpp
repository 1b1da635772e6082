#include <gtest/gtest.h>

#include <array>
#include <cstdint>

#include "archive/BitLoad.hpp"

namespace tessel::archive {
namespace {

// The `count` bits from `bit` on, one by one.
std::uint64_t bitByBit(const std::uint8_t* stream, unsigned bit,
                       unsigned count) {
    std::uint64_t value = 0;
    for (unsigned i = bit; i < bit + count; ++i)
        value = value << 1 | (stream[i / 8] >> (7 - i % 8) & 1U);
    return value;
}

constexpr std::array<std::uint8_t, 12> sampleBytes = {
    0x12, 0x34, 0x56, 0x78, 0x9A, 0xBC, 0xDE, 0xF0, 0x0F, 0xED, 0xCB, 0xA9};

TEST(BitLoad, LittleEndianAtAnyAddress) {
    EXPECT_EQ(loadLittle<std::uint16_t>(&sampleBytes[1]), 0x5634);
    EXPECT_EQ(loadLittle<std::uint32_t>(&sampleBytes[3]), 0xDEBC9A78U);
    EXPECT_EQ(loadLittle<std::uint64_t>(&sampleBytes[1]), 0x0FF0DEBC9A785634U);
}

TEST(BitLoad, StartsWithTheWantedBit) {
    for (unsigned bit = 0; bit < 32; ++bit)
        EXPECT_EQ(loadBits(sampleBytes.data(), bit) >> (64 - bitsPerLoad),
                  bitByBit(sampleBytes.data(), bit, bitsPerLoad))
            << bit;
}

TEST(BitLoad, FillsUpWithZeros) {
    EXPECT_EQ(loadBits(sampleBytes.data(), 7) & 0x7F, 0U);
}

}  // namespace
}  // namespace tessel::archive
