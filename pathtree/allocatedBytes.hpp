#pragma once

#include <malloc.h>

#include <cstddef>

namespace tessel {

// What the allocator gave out for a block of the heap, its own header
// included; 0 for none.
inline std::size_t allocatedBytes(void* memory) noexcept {
    return memory == nullptr ? 0
                             : malloc_usable_size(memory) + sizeof(std::size_t);
}

}  // namespace tessel
