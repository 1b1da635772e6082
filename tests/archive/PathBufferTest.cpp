#include <gtest/gtest.h>

#include <cstddef>
#include <cstring>
#include <functional>

#include "archive/PathBuffer.hpp"

namespace tessel::archive {
namespace {

bool isWithin(PathBuffer& buffer) {
    const auto* const object = reinterpret_cast<const char*>(&buffer);
    const std::less<> isLess;
    return !isLess(buffer.data(), object) &&
           isLess(buffer.data(), object + sizeof buffer);
}

TEST(PathBuffer, HoldsFewBytesInItself) {
    PathBuffer none(0);
    EXPECT_TRUE(isWithin(none));
    PathBuffer most(PathBuffer::inlineBytes);
    EXPECT_TRUE(isWithin(most));
    std::memset(most.data(), 1, PathBuffer::inlineBytes);
    EXPECT_EQ(most.data()[PathBuffer::inlineBytes - 1], 1);
}

TEST(PathBuffer, HoldsManyBytesOnTheHeap) {
    constexpr std::size_t bytes = PathBuffer::inlineBytes + 1;
    PathBuffer buffer(bytes);
    EXPECT_FALSE(isWithin(buffer));
    std::memset(buffer.data(), 1, bytes);
    EXPECT_EQ(buffer.data()[bytes - 1], 1);
}

}  // namespace
}  // namespace tessel::archive
