#include <gtest/gtest.h>

#include <cstdint>

#include "hosts/console/PathRange.hpp"

namespace {

using tessel::NumberRange;
using tessel::console::parsePathRange;
using tessel::console::PathRange;
using tessel::console::resolve;

TEST(PathRange, ReadsNumbersAndRanges) {
    EXPECT_EQ(parsePathRange("7"), (PathRange{7, 7}));
    EXPECT_EQ(parsePathRange("-1"), (PathRange{-1, -1}));
    EXPECT_EQ(parsePathRange("2-5"), (PathRange{2, 5}));
    EXPECT_EQ(parsePathRange("-10--1"), (PathRange{-10, -1}));
    EXPECT_EQ(parsePathRange("3--2"), (PathRange{3, -2}));
    EXPECT_EQ(parsePathRange("-5-9"), (PathRange{-5, 9}));
    EXPECT_EQ(parsePathRange("007"), (PathRange{7, 7}));
    EXPECT_EQ(parsePathRange("9223372036854775807"),
              (PathRange{INT64_MAX, INT64_MAX}));
}

TEST(PathRange, NumbersThatAreTooLargeAreInNoList) {
    EXPECT_EQ(parsePathRange("9223372036854775808"),
              (PathRange{INT64_MAX, INT64_MAX}));
    EXPECT_EQ(parsePathRange("-9223372036854775809"),
              (PathRange{INT64_MIN, INT64_MIN}));
    EXPECT_EQ(parsePathRange("-99999999999999999999-18446744073709551616"),
              (PathRange{INT64_MIN, INT64_MAX}));
    EXPECT_EQ(resolve({INT64_MAX, INT64_MAX}, INT64_MAX), std::nullopt);
}

TEST(PathRange, RefusesWhatIsNone) {
    for (const char* text :
         {"", "-", "--1", "+1", " 1", "1 ", "1-", "1-2-3", "1..2", "a", "1a",
          "0x1", "9223372036854775808x", "1--", "1---2"})
        EXPECT_EQ(parsePathRange(text), std::nullopt) << text;
}

TEST(PathRange, ResolvesFromBothEnds) {
    EXPECT_EQ(resolve({0, 0}, 10), (NumberRange{0, 1}));
    EXPECT_EQ(resolve({9, 9}, 10), (NumberRange{9, 10}));
    EXPECT_EQ(resolve({-10, -1}, 10), (NumberRange{0, 10}));
    EXPECT_EQ(resolve({3, -3}, 10), (NumberRange{3, 8}));
}

TEST(PathRange, RefusesWhatIsNotInTheList) {
    EXPECT_EQ(resolve({10, 10}, 10), std::nullopt);
    EXPECT_EQ(resolve({-11, -1}, 10), std::nullopt);
    EXPECT_EQ(resolve({0, 10}, 10), std::nullopt);
    EXPECT_EQ(resolve({5, 2}, 10), std::nullopt) << "ranges go upwards";
    EXPECT_EQ(resolve({0, 0}, 0), std::nullopt);
    EXPECT_EQ(resolve({-1, -1}, 0), std::nullopt);
    EXPECT_EQ(resolve({INT64_MIN, INT64_MAX}, 10), std::nullopt);
}

}  // namespace
