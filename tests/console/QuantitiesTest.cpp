#include <gtest/gtest.h>

#include "hosts/console/Quantities.hpp"

namespace {

using tessel::console::bytesText;
using tessel::console::countText;
using tessel::console::durationText;
using tessel::console::groupedText;

TEST(Quantities, Groups) {
    EXPECT_EQ(groupedText(0), "0");
    EXPECT_EQ(groupedText(999), "999");
    EXPECT_EQ(groupedText(1000), "1,000");
    EXPECT_EQ(groupedText(1234567), "1,234,567");
    EXPECT_EQ(groupedText(18446744073709551615U), "18,446,744,073,709,551,615");
}

TEST(Quantities, ThreeDigitsAndAUnit) {
    EXPECT_EQ(bytesText(0), "0 B");
    EXPECT_EQ(bytesText(999), "999 B");
    EXPECT_EQ(bytesText(999.6), "1.00 kB");
    EXPECT_EQ(bytesText(4550000), "4.55 MB");
    EXPECT_EQ(bytesText(99960), "100 kB");
    EXPECT_EQ(countText(12345), "12.3 k");
    EXPECT_EQ(countText(7.3e18), "7300000 T");
}

TEST(Quantities, Durations) {
    EXPECT_EQ(durationText(0.4), "0:00");
    EXPECT_EQ(durationText(59.6), "1:00");
    EXPECT_EQ(durationText(754), "12:34");
    EXPECT_EQ(durationText(3723), "1:02:03");
    EXPECT_EQ(durationText(1e30), "99:59:59");
    EXPECT_EQ(durationText(-1), "0:00");
}

}  // namespace
