#include <gtest/gtest.h>

#include <cstring>
#include <thread>
#include <vector>

#include "hosts/embedded/BlockPool.hpp"

namespace tessel::embedded {

namespace {

// Sizes are given that no other test uses, so that kept blocks are this one's.
constexpr std::size_t size = BlockPool::maxSize - 40;

bool poolKeeps() {
    BlockPool::release(BlockPool::allocate(size), size);
    return BlockPool::keptCount(size) != 0;
}

}  // namespace

TEST(BlockPoolTest, ReleasedBlockIsUsedAgainForItsSizeClass) {
    if (!poolKeeps()) GTEST_SKIP() << "this build keeps no blocks";
    const std::size_t kept = BlockPool::keptCount(size);
    void* const first = BlockPool::allocate(size);
    EXPECT_EQ(BlockPool::keptCount(size), kept - 1);
    BlockPool::release(first, size);
    EXPECT_EQ(BlockPool::keptCount(size), kept);
    EXPECT_EQ(BlockPool::allocate(size - 1), first);
    BlockPool::release(first, size - 1);
}

TEST(BlockPoolTest, EveryByteOfABlockCanBeWritten) {
    for (std::size_t bytes = 8; bytes <= BlockPool::maxSize + 8; ++bytes) {
        for (int round = 0; round < 2; ++round) {
            void* const block = BlockPool::allocate(bytes);
            std::memset(block, 0xA5, bytes);
            BlockPool::release(block, bytes);
        }
    }
}

TEST(BlockPoolTest, BlocksInUseAreDistinct) {
    std::vector<unsigned char*> blocks;
    for (std::size_t i = 0; i < 100; ++i) {
        blocks.push_back(static_cast<unsigned char*>(BlockPool::allocate(64)));
        std::memset(blocks.back(), static_cast<int>(i), 64);
    }
    for (std::size_t i = 0; i < 100; ++i) {
        EXPECT_EQ(blocks[i][0], i);
        EXPECT_EQ(blocks[i][63], i);
        BlockPool::release(blocks[i], 64);
    }
}

TEST(BlockPoolTest, KeepsNoMoreThanItsMaximum) {
    std::vector<void*> blocks;
    for (std::size_t i = 0; i < BlockPool::maxKept + 10; ++i)
        blocks.push_back(BlockPool::allocate(size));
    for (void* const block : blocks) BlockPool::release(block, size);
    EXPECT_LE(BlockPool::keptCount(size), BlockPool::maxKept);
}

TEST(BlockPoolTest, LargeBlocksAreNotKept) {
    constexpr std::size_t large = BlockPool::maxSize + 1;
    BlockPool::release(BlockPool::allocate(large), large);
    EXPECT_EQ(BlockPool::keptCount(large), 0U);
}

TEST(BlockPoolTest, BlockMayBeReleasedOnAnotherThread) {
    const std::size_t kept = BlockPool::keptCount(size);
    void* const block = BlockPool::allocate(size);
    std::thread other([&] {
        BlockPool::release(block, size);
        EXPECT_LE(BlockPool::keptCount(size), 1U);
    });
    other.join();
    EXPECT_LE(BlockPool::keptCount(size), kept);
}

}  // namespace tessel::embedded
