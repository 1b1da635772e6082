#pragma once

#include <cstddef>

// What this program's heap holds. The program's own malloc, which passes
// everything on to the C library's, also counts, while a HeapPeak lives.
namespace bench {

// Bytes in use by the allocator's own figures, its overhead included.
std::size_t heapInUse();

// Watches how much more the heap held, at most, than at its construction.
//
// Threads: allocations of all threads are counted. One at a time.
// Cost: slows every allocation by some nanoseconds while it lives.
class HeapPeak {
public:
    HeapPeak();
    HeapPeak(const HeapPeak&) = delete;
    HeapPeak& operator=(const HeapPeak&) = delete;
    ~HeapPeak();

    std::size_t bytes() const noexcept;

    // False where a sanitizer has replaced the allocator: then bytes() is 0.
    static bool works() noexcept;
};

}  // namespace bench
