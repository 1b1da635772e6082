#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <numeric>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/OrderedScan.hpp"

namespace tessel::archive {
namespace {

ScanOptions onThreads(unsigned threads) {
    ScanOptions options;
    options.threads = threads;
    return options;
}

// What a scan of so many chunks consumes, each chunk's result its square.
std::vector<std::uint64_t> squares(std::uint64_t chunks, unsigned threads) {
    const auto options = onThreads(threads);
    OrderedScan scan(chunks, options);
    std::vector<std::uint64_t> results(scan.slots());
    std::vector<std::uint64_t> consumed;
    scan.run([&](auto chunk) { results[chunk % scan.slots()] = chunk * chunk; },
             [&](auto chunk) {
                 consumed.push_back(results[chunk % scan.slots()]);
                 return true;
             });
    return consumed;
}

TEST(OrderedScan, ConsumesInOrderOnAnyNumberOfThreads) {
    for (const unsigned threads : {0U, 1U, 2U, 3U, 16U})
        for (const std::uint64_t chunks : {0U, 1U, 2U, 1000U}) {
            const auto consumed = squares(chunks, threads);
            ASSERT_EQ(consumed.size(), chunks);
            for (std::uint64_t c = 0; c < chunks; ++c)
                ASSERT_EQ(consumed[c], c * c);
        }
}

TEST(OrderedScan, NeverRunsFurtherAheadThanItsSlots) {
    const auto options = onThreads(4);
    OrderedScan scan(500, options);
    std::atomic<std::uint64_t> consumed = 0;
    std::atomic<bool> tooFar = false;
    scan.run(
        [&](auto chunk) {
            if (chunk >= consumed.load() + 1 + scan.slots()) tooFar = true;
        },
        [&](auto) { return ++consumed, true; });
    EXPECT_FALSE(tooFar);
    EXPECT_EQ(consumed, 500U);
}

TEST(OrderedScan, EndsWhenTheConsumerHasEnough) {
    const auto options = onThreads(3);
    OrderedScan scan(1'000'000, options);
    std::atomic<std::uint64_t> produced = 0;
    scan.run([&](auto) { ++produced; }, [](auto chunk) { return chunk < 5; });
    EXPECT_LE(produced, 6 + scan.slots());
}

TEST(OrderedScan, ThrowsTheFirstChunksFailure) {
    for (const unsigned threads : {1U, 4U}) {
        const auto options = onThreads(threads);
        OrderedScan scan(100, options);
        std::uint64_t consumed = 0;
        const auto failFrom40 = [](std::uint64_t chunk) {
            if (chunk >= 40) throw std::runtime_error(std::to_string(chunk));
        };
        try {
            scan.run(failFrom40, [&](auto) { return ++consumed, true; });
            FAIL();
        } catch (const std::runtime_error& error) {
            EXPECT_STREQ(error.what(), "40");
        }
        EXPECT_EQ(consumed, 40U);
    }
}

TEST(OrderedScan, ConsumersFailureReachesTheCaller) {
    const auto options = onThreads(2);
    OrderedScan scan(100, options);
    EXPECT_THROW(
        scan.run([](auto) {},
                 [](auto) -> bool { throw std::runtime_error("full"); }),
        std::runtime_error);
}

TEST(OrderedScan, CanBeCancelled) {
    std::stop_source source;
    ScanOptions options = onThreads(2);
    options.cancel = source.get_token();
    OrderedScan scan(1'000'000, options);
    std::uint64_t consumed = 0;
    EXPECT_THROW(scan.run([](auto) {},
                          [&](auto) {
                              if (++consumed == 3) source.request_stop();
                              return true;
                          }),
                 CancelledException);
    EXPECT_EQ(consumed, 3U);
}

TEST(OrderedScan, ReportsTheEnd) {
    std::vector<std::pair<std::uint64_t, std::uint64_t>> reports;
    ScanOptions options = onThreads(1);
    options.progress = [&](auto done, auto total) {
        reports.emplace_back(done, total);
    };
    OrderedScan scan(7, options);
    scan.run([](auto) {}, [](auto) { return true; });
    ASSERT_FALSE(reports.empty());
    EXPECT_EQ(reports.back(),
              std::make_pair(std::uint64_t{7}, std::uint64_t{7}));
}

}  // namespace
}  // namespace tessel::archive
