#include <gtest/gtest.h>

#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/ScatteredReader.hpp"
#include "tests/archive/Archives.hpp"

namespace tessel::archive {
namespace {

using archives::OpenArchive;
using archives::Paths;

// Reads these numbers of the list's second segment and compares the paths.
void expectPaths(const Paths& list, const std::vector<std::uint64_t>& wanted) {
    const OpenArchive archive(list, archives::segmentsOf(list.size() / 2));
    const Segment& segment = archive.reader().segment(1);
    std::vector<std::uint64_t> numbers;
    for (const std::uint64_t number : wanted)
        numbers.push_back(segment.entry().firstNumber +
                          number % segment.size());
    std::size_t next = 0;
    ScatteredReader(segment).read(numbers,
                                  [&](auto number, std::string_view path) {
                                      ASSERT_EQ(number, numbers[next++]);
                                      ASSERT_EQ(path, list[number]);
                                  });
    EXPECT_EQ(next, numbers.size());
}

TEST(ScatteredReader, ReadsAnyNumbersInOrderAsked) {
    const Paths sorted = archives::sortedPaths(2000);
    for (const Paths& list : {sorted, archives::shuffled(sorted)})
        for (const std::uint64_t step : {0U, 1U, 2U, 31U, 33U, 999U}) {
            std::vector<std::uint64_t> numbers;
            for (std::uint64_t i = 0; i < 300; ++i) numbers.push_back(i * step);
            expectPaths(list, numbers);
        }
}

TEST(ScatteredReader, ReadsFewerThanItLooksAhead) {
    const Paths list = archives::shuffled(archives::sortedPaths(200));
    for (std::uint64_t count = 0; count < 12; ++count)
        expectPaths(list, std::vector<std::uint64_t>(count, 50));
}

TEST(ScatteredReader, ReadsRanges) {
    const Paths list = archives::shuffled(archives::sortedPaths(1000));
    const OpenArchive archive(list);
    std::uint64_t next = 100;
    ScatteredReader(archive.segment())
        .read(100, 900, [&](auto number, std::string_view path) {
            ASSERT_EQ(number, next++);
            ASSERT_EQ(path, list[number]);
        });
    EXPECT_EQ(next, 900U);
}

}  // namespace
}  // namespace tessel::archive
