// Calls through a view reach what it refers to.

#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "paths/FunctionView.hpp"

namespace {

using tessel::FunctionView;

int callWith(FunctionView<int(int)> call, int number) { return call(number); }

TEST(FunctionView, CallsWhatItRefersTo) {
    int calls = 0;
    const auto counting = [&](int number) {
        ++calls;
        return number + 1;
    };
    EXPECT_EQ(callWith(counting, 3), 4);
    EXPECT_EQ(callWith([](int number) { return number - 1; }, 3), 2);
    EXPECT_EQ(calls, 1);
}

TEST(FunctionView, ChangesTheStateOfAMutableCallable) {
    const auto count = [calls = 0](int) mutable { return ++calls; };
    auto mutableCount = count;
    const FunctionView<int(int)> view = mutableCount;
    EXPECT_EQ(view(0), 1);
    EXPECT_EQ(view(0), 2);
    EXPECT_EQ(mutableCount(0), 3);
}

TEST(FunctionView, PassesArgumentsOn) {
    const auto take = [](std::unique_ptr<int> number) { return *number; };
    const FunctionView<int(std::unique_ptr<int>)> view = take;
    EXPECT_EQ(view(std::make_unique<int>(5)), 5);
    int target = 0;
    const auto set = [](int& to) { to = 7; };
    const FunctionView<void(int&)> setter = set;
    setter(target);
    EXPECT_EQ(target, 7);
}

TEST(FunctionView, ACopyRefersToTheSame) {
    int calls = 0;
    const auto counting = [&] { ++calls; };
    const FunctionView<void()> view = counting;
    const FunctionView<void()> copy = view;  // NOLINT(*-unnecessary-copy-*)
    copy();
    EXPECT_EQ(calls, 1);
}

}  // namespace
