#include <gtest/gtest.h>

#include <cstdint>

#include "archive/SequentialReader.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

TEST(SequentialReader, GoesThroughAllSegments) {
    const auto sorted = archives::sortedPaths(1000);
    for (const auto& list : {sorted, archives::shuffled(sorted)}) {
        const archives::OpenArchive archive(list, archives::segmentsOf(77));
        SequentialReader reader(archive.reader());
        for (std::uint64_t i = 0; i < list.size(); ++i) {
            ASSERT_EQ(reader.number(), i);
            ASSERT_EQ(reader.next(), list[i]);
        }
        EXPECT_EQ(reader.number(), list.size());
    }
}

}  // namespace
}  // namespace tessel::archive
