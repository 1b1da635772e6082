#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <new>

#include "tests/support/AllocationMeter.hpp"

namespace support {

// How atEachAllocation counts.
struct AllocationCount {
    FailingThreads threads = FailingThreads::ThisOne;
    FailingAllocations allocations = FailingAllocations::AllLater;
    // From this number on, only each step-th allocation fails.
    std::size_t allUpTo = ~std::size_t{0};
    std::size_t step = 1;
    // More than the operation makes.
    std::size_t most = 5000;
};

// Calls operate() with 0, 1, 2 and so on allocations to spend, until they are
// enough. Calls prepare() before and check(succeeded) after it. An operation
// that lacks memory throws std::bad_alloc or does without.
template <class Prepare, class Operate, class Check>
void atEachAllocation(Prepare prepare, Operate operate, Check check,
                      AllocationCount count = {}) {
    std::size_t n = 0;
    for (bool enough = false; !enough && n < count.most;
         n += n < count.allUpTo ? 1 : count.step) {
        prepare();
        bool succeeded = true;
        {
            const AllocationFailure failure(n, count.threads,
                                            count.allocations);
            try {
                operate();
            } catch (const std::bad_alloc&) {
                succeeded = false;
            }
            enough = !failure.happened();
        }
        EXPECT_TRUE(succeeded || !enough) << "threw although there was memory";
        check(succeeded);
    }
    EXPECT_GT(n, 1U) << "nothing was allocated";
    EXPECT_LT(n, count.most);
}

}  // namespace support
