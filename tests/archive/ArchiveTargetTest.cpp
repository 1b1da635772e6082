#include <gtest/gtest.h>

#include "archive/ArchiveTarget.hpp"

namespace tessel::archive {
namespace {

using Bytes = std::vector<std::uint8_t>;

TEST(ArchiveTargetTest, MemoryIsReplacedByCommitOnly) {
    Bytes out = {9};
    MemoryTarget target(out);
    target.append(Bytes{0, 2});
    target.append(Bytes{3});
    target.rewriteStart(Bytes{1});
    EXPECT_EQ(out, Bytes{9});
    target.commit();
    EXPECT_EQ(out, (Bytes{1, 2, 3}));
}

}  // namespace
}  // namespace tessel::archive
