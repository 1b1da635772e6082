// What the allocator gave out.

#include <gtest/gtest.h>

#include <cstdlib>

#include "pathtree/allocatedBytes.hpp"

namespace {

TEST(AllocatedBytes, CoverTheBlockAndItsHeader) {
    EXPECT_EQ(tessel::allocatedBytes(nullptr), 0U);
    for (const std::size_t bytes : {1U, 100U, 100000U}) {
        void* block = std::malloc(bytes);
        EXPECT_GE(tessel::allocatedBytes(block), bytes + sizeof(std::size_t));
        EXPECT_LE(tessel::allocatedBytes(block), bytes + 8192);
        std::free(block);
    }
}

}  // namespace
