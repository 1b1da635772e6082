// The one bounded reader of outside bytes.

#include <gtest/gtest.h>

#include <algorithm>
#include <utility>

#include "packing/ByteCursor.hpp"
#include "tests/support/Bytes.hpp"

namespace {

using namespace tessel::sixpacks;
using support::Bytes;
using tessel::DamagedFormException;

TEST(ByteCursor, TakesFromTheFrontAndStopsAtTheEnd) {
    const Bytes bytes = {1, 2, 3, 4, 5};
    ByteCursor cursor(bytes);
    EXPECT_EQ(cursor.takeByte(), 1);
    const auto two = cursor.take(2);
    EXPECT_EQ(Bytes(two.begin(), two.end()), (Bytes{2, 3}));
    EXPECT_EQ(cursor.remaining(), 2U);
    EXPECT_THROW(cursor.take(3), DamagedFormException);
    EXPECT_EQ(cursor.remaining(), 2U);
    EXPECT_THROW(cursor.takeUint(PackedSizeT::Uint32), DamagedFormException);
    EXPECT_EQ(cursor.takeUint(PackedSizeT::Uint16), 0x0504U);
    EXPECT_TRUE(cursor.empty());
    EXPECT_TRUE(cursor.take(0).empty());
    EXPECT_THROW(cursor.takeByte(), DamagedFormException);
}

TEST(ByteCursor, AClaimOfAnySizeIsRefused) {
    const Bytes bytes(16, 0xFF);
    ByteCursor cursor(bytes);
    EXPECT_THROW(cursor.take(~std::uint64_t{0}), DamagedFormException);
    EXPECT_THROW(cursor.take(17), DamagedFormException);
    EXPECT_EQ(cursor.take(16).size(), 16U);
    EXPECT_THROW(ByteCursor({}).takeByte(), DamagedFormException);
}

TEST(ByteCursor, ItemsMustFitInWhatIsLeft) {
    const Bytes bytes(16);
    const ByteCursor cursor(bytes);
    EXPECT_NO_THROW(cursor.requireItems(0, 8));
    EXPECT_NO_THROW(cursor.requireItems(16, 1));
    EXPECT_NO_THROW(cursor.requireItems(2, 8));
    EXPECT_NO_THROW(cursor.requireItems(5, 3));
    EXPECT_THROW(cursor.requireItems(17, 1), DamagedFormException);
    EXPECT_THROW(cursor.requireItems(3, 8), DamagedFormException);
    EXPECT_THROW(cursor.requireItems(6, 3), DamagedFormException);
    EXPECT_THROW(cursor.requireItems(std::uint64_t{1} << 61, 8),
                 DamagedFormException);
    EXPECT_THROW(cursor.requireItems(~std::uint64_t{0}, 8),
                 DamagedFormException);
}

TEST(ByteCursor, AnUnknownWidthTakesNothing) {
    const Bytes bytes(16);
    ByteCursor cursor(bytes);
    for (unsigned code = 4; code < 256; ++code)
        EXPECT_THROW(cursor.takeUint(static_cast<PackedSizeT>(code)),
                     InvalidUintConversionException);
    EXPECT_EQ(cursor.remaining(), 16U);
}

// Makes the bytes 0, 1, 2 and so on, three more at a time.
class CountingSource final : public ByteSource {
public:
    explicit CountingSource(std::size_t count) : count_(count) {}

    std::size_t remaining() const noexcept override { return count_ - made_; }
    std::span<const std::uint8_t> nextBlock(std::span<const std::uint8_t> rest,
                                            std::uint64_t size) override {
        Bytes block(rest.begin(), rest.end());
        while (remaining() > 0 && block.size() < std::max<std::size_t>(size, 3))
            block.push_back(static_cast<std::uint8_t>(made_++));
        if (block.size() < size) throw DamagedFormException();
        block_ = std::move(block);
        return block_;
    }

private:
    std::size_t count_;
    std::size_t made_ = 0;
    Bytes block_;
};

TEST(ByteCursor, ReadsASourceAsItReadsBytes) {
    CountingSource source(12);
    ByteCursor cursor(source);
    EXPECT_EQ(cursor.remaining(), 12U);
    EXPECT_FALSE(cursor.empty());
    EXPECT_EQ(cursor.takeByte(), 0);
    EXPECT_EQ(cursor.remaining(), 11U);
    EXPECT_EQ(cursor.takeUint(PackedSizeT::Uint32), 0x04030201U);
    EXPECT_NO_THROW(cursor.requireItems(7, 1));
    EXPECT_THROW(cursor.requireItems(8, 1), DamagedFormException);
    EXPECT_THROW(cursor.take(8), DamagedFormException);
    EXPECT_THROW(cursor.take(~std::uint64_t{0}), DamagedFormException);
    EXPECT_EQ(cursor.remaining(), 7U);
    const auto rest = cursor.take(7);
    EXPECT_EQ(Bytes(rest.begin(), rest.end()), (Bytes{5, 6, 7, 8, 9, 10, 11}));
    EXPECT_TRUE(cursor.empty());
    EXPECT_THROW(cursor.takeByte(), DamagedFormException);
}

}  // namespace
