#include "pathtree/NodeSlab.hpp"

#include <cstdlib>
#include <memory>
#include <new>

#include "pathtree/allocatedBytes.hpp"

namespace tessel {

NodeSlab* NodeSlab::create(std::size_t bytes) {
    void* memory = nullptr;
    if (posix_memalign(&memory, alignment, bytes) != 0) throw std::bad_alloc();
    return new (memory) NodeSlab(bytes);
}

// Relaxed: release() has ordered all that the nodes' threads did.
NodeSlab::~NodeSlab() { delete storeTable_.load(std::memory_order_relaxed); }

void NodeSlab::free() noexcept {
    this->~NodeSlab();
    std::free(this);
}

// ---- Children of nodes that were made as leaves ----

// A node that has a store finds the table: this thread made it, or was handed
// the node by the one that did. Acquire: so that the table is seen whole even
// if another node's thread made it.
ChildStore NodeSlab::childStore(const BNode* node) const noexcept {
    StoreTable& table = *storeTable_.load(std::memory_order_acquire);
    const std::lock_guard lock(table.access);
    return table.stores.find(node)->second;
}

void NodeSlab::setChildStore(const BNode* node, ChildStore kept) {
    StoreTable& table = madeStoreTable();
    const std::lock_guard lock(table.access);
    table.stores[node] = kept;
}

void NodeSlab::forgetChildStore(const BNode* node) noexcept {
    StoreTable& table = *storeTable_.load(std::memory_order_acquire);
    const std::lock_guard lock(table.access);
    table.stores.erase(node);
}

// Two trees with nodes in this slab may come here at once: the first table
// that is stored serves both.
NodeSlab::StoreTable& NodeSlab::madeStoreTable() {
    StoreTable* table = storeTable_.load(std::memory_order_acquire);
    if (table != nullptr) return *table;
    auto made = std::make_unique<StoreTable>();
    if (storeTable_.compare_exchange_strong(table, made.get(),
                                            std::memory_order_acq_rel,
                                            std::memory_order_acquire))
        return *made.release();
    return *table;
}

std::size_t NodeSlab::memoryBytes() noexcept {
    StoreTable* table = storeTable_.load(std::memory_order_acquire);
    if (table == nullptr) return allocatedBytes(this);
    // The map's links: a pointer, the key and the store, 24 bytes, for which
    // the allocator takes 32.
    constexpr std::size_t mapLink = 32;
    const std::lock_guard lock(table->access);
    return allocatedBytes(this) + allocatedBytes(table) +
           table->stores.size() * mapLink +
           table->stores.bucket_count() * sizeof(void*) + sizeof(std::size_t);
}

}  // namespace tessel
