// The maximum that several threads raise.

#include <gtest/gtest.h>

#include <thread>
#include <vector>

#include "coder/AtomicMaximum.hpp"

namespace {

using tessel::AtomicMaximum;

TEST(AtomicMaximum, IsTheLargestOfWhatAnyThreadRaised) {
    AtomicMaximum maximum;
    std::vector<std::thread> threads;
    for (std::uint64_t t = 0; t < 4; ++t)
        threads.emplace_back([&maximum, t] {
            for (std::uint64_t i = 0; i < 1000; ++i) maximum.raise(4 * i + t);
        });
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(maximum, 3999U);
    maximum.raise(5);
    EXPECT_EQ(maximum, 3999U);
    const AtomicMaximum copy = maximum;
    maximum = 2;
    EXPECT_EQ(maximum, 2U);
    EXPECT_EQ(copy, 3999U);
}

}  // namespace
