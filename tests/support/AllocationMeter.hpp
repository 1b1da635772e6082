#pragma once

#include <cstddef>

namespace support {

// Watches what this thread allocates while it exists. Only in programs that
// are linked with support/AllocationMeter.cpp and wrap malloc, calloc,
// realloc and posix_memalign.
class AllocationMeter {
public:
    AllocationMeter();
    ~AllocationMeter();
    AllocationMeter(const AllocationMeter&) = delete;
    AllocationMeter& operator=(const AllocationMeter&) = delete;

    std::size_t largest() const;  // single allocation, in bytes
    std::size_t total() const;    // of all allocations, in bytes
};

}  // namespace support
