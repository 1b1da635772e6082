#include "tests/support/AllocationMeter.hpp"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <new>

namespace {

thread_local bool watching = false;
thread_local std::size_t largestBytes = 0;
thread_local std::size_t totalBytes = 0;

thread_local bool failing = false;
thread_local std::size_t allocationsLeft = 0;
thread_local bool failed = false;

// The same for all threads at once. Sequentially consistent: cheap enough.
std::atomic<bool> allFailing{false};
std::atomic<long> allAllocationsLeft{0};
std::atomic<bool> anyFailed{false};

// Whether one allocation is to fail, and those after it not.
std::atomic<bool> oneAlone{false};

// Counts an allocation; false if it is to fail.
bool allow(std::size_t bytes) {
    if (watching) {
        largestBytes = std::max(largestBytes, bytes);
        totalBytes += bytes;
    }
    if (allFailing) {
        const long left = --allAllocationsLeft;
        if (left == -1 || (left < 0 && !oneAlone)) {
            anyFailed = true;
            return false;
        }
    }
    if (!failing) return true;
    if (allocationsLeft > 0) {
        --allocationsLeft;
        return true;
    }
    failed = true;
    failing = !oneAlone;
    return false;
}

}  // namespace

// The linker sends every call of these four in the program to the wrappers.
extern "C" {
void* __real_malloc(std::size_t bytes);
void* __real_calloc(std::size_t count, std::size_t bytes);
void* __real_realloc(void* memory, std::size_t bytes);
int __real_posix_memalign(void** memory, std::size_t alignment,
                          std::size_t bytes);

void* __wrap_malloc(std::size_t bytes) {
    return allow(bytes) ? __real_malloc(bytes) : nullptr;
}

void* __wrap_calloc(std::size_t count, std::size_t bytes) {
    return allow(count * bytes) ? __real_calloc(count, bytes) : nullptr;
}

void* __wrap_realloc(void* memory, std::size_t bytes) {
    return allow(bytes) ? __real_realloc(memory, bytes) : nullptr;
}

int __wrap_posix_memalign(void** memory, std::size_t alignment,
                          std::size_t bytes) {
    return allow(bytes) ? __real_posix_memalign(memory, alignment, bytes)
                        : ENOMEM;
}
}

void* operator new(std::size_t bytes) {
    if (void* memory = std::malloc(bytes)) return memory;
    throw std::bad_alloc();
}

// What a stable sort asks for; it does with less where there is none.
void* operator new(std::size_t bytes, const std::nothrow_t&) noexcept {
    return std::malloc(bytes);
}

void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t /*bytes*/) noexcept {
    std::free(memory);
}

namespace support {

AllocationMeter::AllocationMeter() {
    largestBytes = 0;
    totalBytes = 0;
    watching = true;
}

AllocationMeter::~AllocationMeter() { watching = false; }

std::size_t AllocationMeter::largest() const { return largestBytes; }

std::size_t AllocationMeter::total() const { return totalBytes; }

AllocationFailure::AllocationFailure(std::size_t count, FailingThreads threads,
                                     FailingAllocations allocations) {
    oneAlone = allocations == FailingAllocations::One;
    allocationsLeft = count;
    allAllocationsLeft = static_cast<long>(count);
    failed = false;
    anyFailed = false;
    failing = threads == FailingThreads::ThisOne;
    allFailing = threads == FailingThreads::All;
}

AllocationFailure::~AllocationFailure() {
    failing = false;
    allFailing = false;
}

bool AllocationFailure::happened() const { return failed || anyFailed; }

}  // namespace support
