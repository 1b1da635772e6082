#include "tests/host/FailingAllocation.hpp"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

std::atomic<long> countdown{0};  // to the failure; 0 or less: none to come
std::atomic<unsigned long> asked{0};

void* allocate(std::size_t size) {
    asked += size;
    if (countdown > 0 && --countdown == 0) throw std::bad_alloc();
    void* const memory = std::malloc(size == 0 ? 1 : size);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}

}  // namespace

namespace failing {

Allocation::Allocation(long n) { countdown = n; }
Allocation::~Allocation() { countdown = 0; }
bool Allocation::hasFailed() const { return countdown <= 0; }
unsigned long bytesAsked() { return asked; }

}  // namespace failing

void* operator new(std::size_t size) { return allocate(size); }
void* operator new[](std::size_t size) { return allocate(size); }
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t /*size*/) noexcept {
    std::free(memory);
}
void operator delete[](void* memory, std::size_t /*size*/) noexcept {
    std::free(memory);
}
