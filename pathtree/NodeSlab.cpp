#include "pathtree/NodeSlab.hpp"

#include <cstdlib>
#include <new>

#include "pathtree/allocatedBytes.hpp"

namespace tessel {

NodeSlab* NodeSlab::create(std::size_t bytes) {
    void* memory = nullptr;
    if (posix_memalign(&memory, alignment, bytes) != 0) throw std::bad_alloc();
    return new (memory) NodeSlab(bytes);
}

void NodeSlab::free() noexcept {
    this->~NodeSlab();
    std::free(this);
}

std::size_t NodeSlab::memoryBytes() noexcept { return allocatedBytes(this); }

}  // namespace tessel
