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

// While it exists, allocations fail after the first `count`. One at a time.
class AllocationFailure {
public:
    explicit AllocationFailure(
        std::size_t count, FailingThreads threads = FailingThreads::ThisOne);
    ~AllocationFailure();
    AllocationFailure(const AllocationFailure&) = delete;
    AllocationFailure& operator=(const AllocationFailure&) = delete;

    // Whether one failed.
    bool happened() const;
};

}  // namespace support
