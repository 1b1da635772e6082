#include "bench/Heap.hpp"

#include <malloc.h>

#include <atomic>
#include <cerrno>
#include <cstdint>

namespace bench {

namespace {

std::atomic<bool>& counting() noexcept {
    static std::atomic<bool> flag{false};
    return flag;
}

// Relative to when counting began.
std::atomic<std::int64_t>& current() noexcept {
    static std::atomic<std::int64_t> bytes{0};
    return bytes;
}

std::atomic<std::int64_t>& highest() noexcept {
    static std::atomic<std::int64_t> bytes{0};
    return bytes;
}

}  // namespace

std::size_t heapInUse() {
    const struct mallinfo2 info = mallinfo2();
    return info.uordblks + info.hblkhd;
}

HeapPeak::HeapPeak() {
    current() = 0;
    highest() = 0;
    counting() = true;
}

HeapPeak::~HeapPeak() { counting() = false; }

std::size_t HeapPeak::bytes() const noexcept {
    return static_cast<std::size_t>(highest().load());
}

#ifdef QZTESSEL_COUNT_HEAP

namespace {

// The allocator's own word in front of every allocation.
constexpr std::int64_t wordBytes = sizeof(std::size_t);

void* taken(void* memory) noexcept {
    if (memory == nullptr || !counting().load(std::memory_order_relaxed)) {
        return memory;
    }
    const auto bytes =
        static_cast<std::int64_t>(malloc_usable_size(memory)) + wordBytes;
    const std::int64_t now =
        current().fetch_add(bytes, std::memory_order_relaxed) + bytes;
    std::int64_t most = highest().load(std::memory_order_relaxed);
    while (now > most && !highest().compare_exchange_weak(
                             most, now, std::memory_order_relaxed)) {
    }
    return memory;
}

void given(void* memory) noexcept {
    if (memory == nullptr || !counting().load(std::memory_order_relaxed)) {
        return;
    }
    const auto bytes =
        static_cast<std::int64_t>(malloc_usable_size(memory)) + wordBytes;
    current().fetch_sub(bytes, std::memory_order_relaxed);
}

}  // namespace

bool HeapPeak::works() noexcept { return true; }

#else

bool HeapPeak::works() noexcept { return false; }

#endif

}  // namespace bench

#ifdef QZTESSEL_COUNT_HEAP

// The C library's allocator under the names that it exports for this purpose.
// NOLINTBEGIN(readability-identifier-naming)
// NOLINTBEGIN(readability-inconsistent-declaration-parameter-name)
extern "C" {
void* __libc_malloc(std::size_t);
void __libc_free(void*);
void* __libc_calloc(std::size_t, std::size_t);
void* __libc_realloc(void*, std::size_t);
void* __libc_memalign(std::size_t, std::size_t);

void* malloc(std::size_t bytes) { return bench::taken(__libc_malloc(bytes)); }

void free(void* memory) {
    bench::given(memory);
    __libc_free(memory);
}

void* calloc(std::size_t count, std::size_t bytes) {
    return bench::taken(__libc_calloc(count, bytes));
}

// Counted as a copy, which it may or may not be.
void* realloc(void* memory, std::size_t bytes) {
    bench::given(memory);
    return bench::taken(__libc_realloc(memory, bytes));
}

void* memalign(std::size_t alignment, std::size_t bytes) {
    return bench::taken(__libc_memalign(alignment, bytes));
}

void* aligned_alloc(std::size_t alignment, std::size_t bytes) {
    return memalign(alignment, bytes);
}

int posix_memalign(void** memory, std::size_t alignment, std::size_t bytes) {
    *memory = memalign(alignment, bytes);
    return *memory == nullptr ? ENOMEM : 0;
}
}
// NOLINTEND(readability-inconsistent-declaration-parameter-name)
// NOLINTEND(readability-identifier-naming)

#endif
