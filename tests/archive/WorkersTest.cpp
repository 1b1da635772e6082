#include <gtest/gtest.h>

#include <stdexcept>

#include "archive/Workers.hpp"

namespace tessel::archive {
namespace {

TEST(WorkersTest, EveryStepRunsOnce) {
    for (const unsigned threads : {0U, 1U, 2U, 5U}) {
        Workers workers(threads, {});
        for (const std::size_t steps : {0U, 1U, 3U, 1000U}) {
            std::vector<std::atomic<int>> runs(steps);
            workers.run(steps, [&](std::size_t index, unsigned worker) {
                ++runs[index];
                EXPECT_LT(worker, workers.count());
            });
            for (const auto& count : runs) EXPECT_EQ(count, 1);
        }
    }
}

TEST(WorkersTest, OneWorkerIsTheCaller) {
    Workers workers(1, {});
    EXPECT_EQ(workers.count(), 1U);
    const auto caller = std::this_thread::get_id();
    workers.run(10, [&](std::size_t, unsigned worker) {
        EXPECT_EQ(worker, 0U);
        EXPECT_EQ(std::this_thread::get_id(), caller);
    });
}

TEST(WorkersTest, ResultsAreVisibleAfterwards) {
    Workers workers(4, {});
    std::vector<std::size_t> squares(10'000);
    for (std::size_t round = 1; round < 20; ++round) {
        workers.run(squares.size(),
                    [&](std::size_t i, unsigned) { squares[i] += i * i; });
        ASSERT_EQ(squares[9'999], 9'999U * 9'999U * round);
    }
}

TEST(WorkersTest, AFailedStepReachesTheCallerAndEndsTheLoop) {
    for (const unsigned threads : {1U, 4U}) {
        Workers workers(threads, {});
        std::atomic<int> runs = 0;
        EXPECT_THROW(workers.run(1'000'000,
                                 [&](std::size_t, unsigned) {
                                     if (++runs == 50)
                                         throw std::runtime_error("no");
                                 }),
                     std::runtime_error);
        EXPECT_LT(runs, 1'000'000);
        runs = 0;
        workers.run(7, [&](std::size_t, unsigned) { ++runs; });
        EXPECT_EQ(runs, 7);
    }
}

TEST(WorkersTest, CancellingEndsTheLoop) {
    for (const unsigned threads : {1U, 4U}) {
        std::stop_source source;
        Workers workers(threads, source.get_token());
        workers.throwIfCancelled();
        std::atomic<int> runs = 0;
        EXPECT_THROW(workers.run(1'000'000,
                                 [&](std::size_t, unsigned) {
                                     if (++runs == 50) source.request_stop();
                                 }),
                     CancelledException);
        EXPECT_LT(runs, 1'000'000);
        EXPECT_THROW(workers.throwIfCancelled(), CancelledException);
    }
}

}  // namespace
}  // namespace tessel::archive
