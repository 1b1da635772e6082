#include "tests/host/FailingAllocation.hpp"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

std::atomic<long> countdown{0};  // to the failure; 0 or less: none to come
std::atomic<unsigned long> asked{0};
std::atomic<unsigned long> released{0};

void* allocate(std::size_t size, std::size_t alignment) {
    asked += size;
    if (countdown > 0 && --countdown == 0) throw std::bad_alloc();
    const std::size_t rounded = (size / alignment + 1) * alignment;
    void* const memory = std::aligned_alloc(alignment, rounded);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}

void* allocate(std::size_t size) {
    return allocate(size, alignof(std::max_align_t));
}

void release(void* memory) noexcept {
    if (memory != nullptr) ++released;
    std::free(memory);
}

}  // namespace

namespace failing {

Allocation::Allocation(long n) { countdown = n; }
Allocation::~Allocation() { countdown = 0; }
bool Allocation::hasFailed() const { return countdown <= 0; }
unsigned long bytesAsked() { return asked; }
unsigned long blocksReleased() { return released; }

}  // namespace failing

// All forms that this program, its modules and their libraries use.
void* operator new(std::size_t size) { return allocate(size); }
void* operator new(std::size_t size, std::align_val_t alignment) {
    return allocate(size, static_cast<std::size_t>(alignment));
}
void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
    try {
        return allocate(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}
void* operator new[](std::size_t size) { return allocate(size); }
void operator delete(void* memory) noexcept { release(memory); }
void operator delete(void* memory, const std::nothrow_t& /*tag*/) noexcept {
    release(memory);
}
void operator delete(void* memory, std::size_t /*size*/) noexcept {
    release(memory);
}
void operator delete(void* memory, std::align_val_t /*alignment*/) noexcept {
    release(memory);
}
void operator delete(void* memory, std::size_t /*size*/,
                     std::align_val_t /*alignment*/) noexcept {
    release(memory);
}
void operator delete[](void* memory) noexcept { release(memory); }
void operator delete[](void* memory, std::size_t /*size*/) noexcept {
    release(memory);
}
