#pragma once

#include <cstddef>

namespace support {

// Both classes work only in programs that are linked with
// support/AllocationMeter.cpp and wrap malloc, calloc, realloc and
// posix_memalign.

// Watches what this thread allocates while it exists.
class AllocationMeter {
public:
    AllocationMeter();
    ~AllocationMeter();
    AllocationMeter(const AllocationMeter&) = delete;
    AllocationMeter& operator=(const AllocationMeter&) = delete;

    std::size_t largest() const;  // single allocation, in bytes
    std::size_t total() const;    // of all allocations, in bytes
};

// Whose allocations an AllocationFailure counts and refuses.
enum class FailingThreads { ThisOne, All };

// Which allocations fail after those that are granted: the next one alone, so
// that one thread may lack memory and the others have it, or all of them.
enum class FailingAllocations { AllLater, One };

// While it exists, allocations fail after the first `count`. One at a time.
class AllocationFailure {
public:
    explicit AllocationFailure(
        std::size_t count, FailingThreads threads = FailingThreads::ThisOne,
        FailingAllocations allocations = FailingAllocations::AllLater);
    ~AllocationFailure();
    AllocationFailure(const AllocationFailure&) = delete;
    AllocationFailure& operator=(const AllocationFailure&) = delete;

    // Whether one failed.
    bool happened() const;
};

}  // namespace support
