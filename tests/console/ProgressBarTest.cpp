#include <gtest/gtest.h>

#include <string>

#include "hosts/console/ProgressBar.hpp"

namespace {

using tessel::console::progressLine;
using tessel::console::ProgressState;
using tessel::console::ProgressUnit;

TEST(ProgressBar, ShowsShareRateAndTimeLeft) {
    const ProgressState state{"packing", ProgressUnit::Paths, 250'000,
                              1'000'000, 2};
    EXPECT_EQ(progressLine(state, 80),
              "packing [=========>                            ]  25 %  125 k "
              "paths/s  0:06 left");
}

TEST(ProgressBar, FitsNarrowTerminals) {
    const ProgressState state{"packing", ProgressUnit::Bytes, 250'000,
                              1'000'000, 2};
    for (std::size_t columns = 0; columns < 100; ++columns)
        EXPECT_LE(progressLine(state, columns).size(), columns);
}

TEST(ProgressBar, WithoutTotalCountsOnly) {
    EXPECT_EQ(progressLine({"walking", ProgressUnit::Paths, 3000, 0, 2}, 80),
              "walking  3.00 k  1.50 k paths/s");
}

TEST(ProgressBar, ExtremesAreShown) {
    EXPECT_EQ(progressLine({"x", ProgressUnit::Steps, 0, 10, 0}, 30),
              "x [>                   ]   0 %");
    EXPECT_EQ(progressLine({"x", ProgressUnit::Steps, 20, 10, 1}, 30),
              "x [====================] 100 %");
}

}  // namespace
