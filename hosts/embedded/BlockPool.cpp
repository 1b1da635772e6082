#include "hosts/embedded/BlockPool.hpp"

#include <new>
#include <utility>

#ifdef __has_feature
#define QZTESSEL_HAS_FEATURE(name) __has_feature(name)
#else
#define QZTESSEL_HAS_FEATURE(name) 0
#endif

namespace tessel::embedded {

namespace {

// The address sanitizer finds the use of a released block only if the block is
// not used again.
#if defined(__SANITIZE_ADDRESS__) || QZTESSEL_HAS_FEATURE(address_sanitizer)
constexpr bool keepsBlocks = false;
#else
constexpr bool keepsBlocks = true;
#endif

}  // namespace

// Returns the thread's blocks to the heap when the thread ends. Values that are
// dropped later, in destructors of static objects, go straight to the heap.
class BlockPool::Closer {
public:
    Closer() noexcept { lists_.stage = Stage::Open; }
    Closer(const Closer&) = delete;
    Closer& operator=(const Closer&) = delete;
    ~Closer() {
        lists_.stage = Stage::Closed;
        for (FreeList& list : lists_.bySize) {
            while (list.first != nullptr)
                ::operator delete(std::exchange(list.first, list.first->next));
        }
    }
};

// NOLINTNEXTLINE(cppcoreguidelines-avoid-non-const-global-variables)
constinit thread_local BlockPool::Lists BlockPool::lists_;

bool BlockPool::isOpen() noexcept {
    if (lists_.stage == Stage::Unused) {
        static thread_local const Closer closer;
        static_cast<void>(closer);
    }
    return lists_.stage == Stage::Open;
}

void* BlockPool::allocate(std::size_t size) {
    if (size > maxSize) return ::operator new(size);
    const std::size_t index = sizeClass(size);
    FreeList& list = lists_.bySize[index];
    if (list.first == nullptr) return ::operator new(index* granularity);
    --list.count;
    return std::exchange(list.first, list.first->next);
}

void BlockPool::release(void* block, std::size_t size) noexcept {
    FreeList& list = lists_.bySize[size > maxSize ? 0 : sizeClass(size)];
    if (!keepsBlocks || size > maxSize || list.count == maxKept || !isOpen()) {
        ::operator delete(block);
        return;
    }
    list.first = new (block) FreeBlock{list.first};
    ++list.count;
}

std::size_t BlockPool::keptCount(std::size_t size) noexcept {
    return size > maxSize ? 0 : lists_.bySize[sizeClass(size)].count;
}

}  // namespace tessel::embedded
