#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <type_traits>

#include "packing/FunctionRef.hpp"

namespace tessel {
namespace {

int apply(FunctionRef<int(int)> function, int value) { return function(value); }

TEST(FunctionRef, CallsWhatItRefersTo) {
    int calls = 0;
    auto count = [&calls](int value) { return calls += value; };
    EXPECT_EQ(apply(count, 3), 3);
    EXPECT_EQ(apply(count, 4), 7);
}

TEST(FunctionRef, KeepsTheCallablesState) {
    auto next = [value = 0](int step) mutable { return value += step; };
    const FunctionRef<int(int)> first = next;
    const FunctionRef<int(int)> second = first;  // refers to the same
    first(1);
    EXPECT_EQ(second(1), 2);
    EXPECT_EQ(next(0), 2);
}

TEST(FunctionRef, CallsAConstCallable) {
    const auto half = [](int value) { return value / 2; };
    EXPECT_EQ(apply(half, 8), 4);
}

TEST(FunctionRef, PassesArgumentsOn) {
    const auto take = [](std::unique_ptr<int> number) { return *number; };
    const FunctionRef<int(std::unique_ptr<int>)> taking = take;
    EXPECT_EQ(taking(std::make_unique<int>(5)), 5);
    int target = 0;
    const auto set = [](int& to) { to = 7; };
    const FunctionRef<void(int&)> setting = set;
    setting(target);
    EXPECT_EQ(target, 7);
}

TEST(FunctionRef, DropsAResultThatIsNotWanted) {
    int calls = 0;
    const auto count = [&calls] { return ++calls; };
    const FunctionRef<void()> counting = count;
    counting();
    EXPECT_EQ(calls, 1);
}

TEST(FunctionRef, LetsExceptionsThrough) {
    EXPECT_THROW(apply([](int) -> int { throw std::runtime_error("no"); }, 1),
                 std::runtime_error);
}

TEST(FunctionRef, TakesOnlyWhatFits) {
    using Predicate = FunctionRef<bool(std::string_view)>;
    const auto noResult = [](std::string_view) {};
    EXPECT_FALSE((std::is_constructible_v<Predicate, decltype(noResult)>));
    EXPECT_FALSE((std::is_constructible_v<Predicate, const char*>));
    EXPECT_FALSE((std::is_constructible_v<Predicate, std::string>));
}

}  // namespace
}  // namespace tessel
