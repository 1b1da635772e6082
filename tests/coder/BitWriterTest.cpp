// Codes to a bit block.

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

#include <utility>
#include <vector>

#include "coder/BitWriter.hpp"
#include "packing/sixpacks.hpp"
#include "tests/support/Bytes.hpp"

namespace {

using support::Bytes;
using tessel::BitWriter;
using tessel::CodeTable;

// How many bits, and the bits.
using BitRun = std::pair<unsigned, std::uint64_t>;

constexpr std::uint8_t untouched = 0xA5;

// The block of these runs, and the bytes after it that must not be touched.
Bytes blockOf(const std::vector<BitRun>& runs, std::size_t bits) {
    Bytes bytes(BitWriter::blockBytes(bits) + BitWriter::slack + 1, untouched);
    BitWriter writer(bytes.data());
    for (const auto& [length, value] : runs) writer.put(value, length);
    const auto end = writer.finish();
    EXPECT_EQ(static_cast<std::size_t>(end - bytes.data()),
              BitWriter::blockBytes(bits));
    EXPECT_EQ(bytes.back(), untouched);
    bytes.resize(BitWriter::blockBytes(bits));
    return bytes;
}

RC_GTEST_PROP(BitWriter, WritesTheBlockOfAllBitsInOrder, ()) {
    const auto runs =
        *rc::gen::nonEmpty(rc::gen::container<std::vector<BitRun>>(rc::gen::map(
            rc::gen::pair(
                rc::gen::inRange<unsigned>(1, CodeTable::longestInline + 1),
                rc::gen::arbitrary<std::uint64_t>()),
            [](const BitRun& any) {
                return BitRun(any.first,
                              any.second & ((1ULL << any.first) - 1));
            })));
    std::vector<bool> bits;
    for (const auto& [length, value] : runs)
        for (unsigned i = 0; i < length; ++i)
            bits.push_back((value >> i & 1U) != 0);
    Bytes expected;
    tessel::sixpacks::boolVecToBytes(expected, bits);
    RC_ASSERT(blockOf(runs, bits.size()) == expected);
}

TEST(BitWriter, FullBytesAreFollowedByAnEmptyOne) {
    EXPECT_EQ(blockOf({{8, 0xFF}}, 8), (Bytes{0xFF, 0x00, 0x00}));
}

TEST(BitWriter, NoBitsNeedNoBlock) { EXPECT_EQ(BitWriter::blockBytes(0), 0U); }

}  // namespace
