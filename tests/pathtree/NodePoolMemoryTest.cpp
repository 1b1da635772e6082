// What names of folders take, of any length, beside what the tree says of them.
// they take.

#include <gtest/gtest.h>
#include <malloc.h>

#include <cstring>

#include "pathtree/BNodePtr.hpp"
#include "pathtree/BPathTree.hpp"
#include "pathtree/NodePool.hpp"
#include "pathtree/NodeSlab.hpp"
#include "tests/support/Trees.hpp"

namespace {

using tessel::BPathTree;
using tessel::Components;

// What the allocator has taken from the system, free pieces included.
std::size_t heapBytes() {
    const struct mallinfo2 info = mallinfo2();
    return info.arena + info.hblkhd;
}

class NameLengths : public ::testing::TestWithParam<std::size_t> {};

// Free pieces between slabs would count here, though no account has them.
TEST_P(NameLengths, TakeWhatTheTreeSays) {
    constexpr std::size_t total = std::size_t{16} << 20;
    const std::size_t length = GetParam();
    malloc_trim(0);
    const std::size_t before = heapBytes();
    BPathTree tree;
    for (std::size_t i = 0; i < total / length; ++i) {
        Components folder = {tessel::Component(length, 2)};
        std::memcpy(folder[0].data(), &i, sizeof i);
        Components files = {{1}};
        tessel::PathTrack track;
        std::uint64_t first = 0;
        tree.addPath(folder, files, track, first);
    }
    const BPathTree::MemoryUsage usage = tree.memoryUsage();
    EXPECT_EQ(usage.names, total / length * (length + 1));
    const std::size_t said =
        usage.names + usage.nodes + usage.childLists + usage.childIndex;
    EXPECT_LE(heapBytes() - before, said + said / 4);
    EXPECT_LE(said, total + total / 4 + total / length * 64);
}

INSTANTIATE_TEST_SUITE_P(Bytes, NameLengths,
                         ::testing::Values(100, 1000, 1025, 3000, 4060, 4100,
                                           5000, 9000, 16000, 16400, 40000));

TEST(NodePoolMemory, APoolLeavesNoSlabBehind) {
    constexpr std::size_t pools = 1000;
    const tessel::Component value(62, 1);
    for (const std::size_t nodes : {1U, 200U}) {
        const std::size_t before = mallinfo2().uordblks;
        for (std::size_t i = 0; i < pools; ++i) {
            tessel::NodePool pool;
            for (std::size_t k = 0; k < nodes; ++k)
                tessel::BNodePtr::adopt(pool.make(value, {}));
        }
        // The allocator keeps a few freed pieces for itself.
        EXPECT_LT(mallinfo2().uordblks,
                  before + pools * tessel::NodeSlab::minBytes / 10);
    }
}

}  // namespace
