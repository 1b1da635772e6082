// The children of a node in one word.

#include <gtest/gtest.h>

#include <array>

#include "pathtree/ChildStore.hpp"

namespace {

using tessel::BNode;
using tessel::ChildBlock;
using tessel::ChildStore;

TEST(ChildStore, AFreshOneHasNoChild) {
    const ChildStore store;
    EXPECT_EQ(store.size(), 0U);
    EXPECT_FALSE(store.isOnly());
    EXPECT_EQ(store.block(), nullptr);
}

TEST(ChildStore, AnOnlyChildTakesNoArray) {
    alignas(4) std::array<char, 8> memory{};
    auto* child = reinterpret_cast<BNode*>(memory.data() + 4);
    const ChildStore store = ChildStore::only(child);
    EXPECT_EQ(store.size(), 1U);
    EXPECT_TRUE(store.isOnly());
    EXPECT_EQ(store.child(), child);
    EXPECT_EQ(store.block(), nullptr);
}

TEST(ChildStore, SeveralChildrenAreInTheSlotsOfABlock) {
    struct {
        ChildBlock block{2, 3};
        std::array<BNode*, 3> slots{};
    } memory;
    const ChildStore store = ChildStore::array(&memory.block);
    EXPECT_EQ(store.size(), 2U);
    EXPECT_FALSE(store.isOnly());
    EXPECT_EQ(store.block(), &memory.block);
    EXPECT_EQ(static_cast<void*>(store.block()->slots()),
              static_cast<void*>(memory.slots.data()));
    memory.block.size = 0;
    EXPECT_EQ(store.size(), 0U);
}

}  // namespace
