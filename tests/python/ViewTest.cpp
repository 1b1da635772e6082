#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <random>
#include <stdexcept>
#include <stop_token>
#include <vector>

#include "hosts/python/View.hpp"

namespace {

using tessel::python::View;
using Numbers = std::vector<std::uint64_t>;

Numbers numbersOf(const View& view) {
    Numbers numbers;
    for (std::uint64_t i = 0; i < view.size(); ++i) numbers.push_back(i);
    view.toNumbers(numbers);
    return numbers;
}

View selected(const View& view, const Numbers& indices) {
    return view.selected(std::make_shared<const Numbers>(indices));
}

// All indices of a view whose numbers are among these, one by one.
Numbers indicesByScan(const View& view, const Numbers& numbers) {
    Numbers indices;
    for (std::uint64_t i = 0; i < view.size(); ++i)
        if (std::ranges::binary_search(numbers, view[i])) indices.push_back(i);
    return indices;
}

void expectInverse(const View& view) {
    Numbers all;
    Numbers some;
    for (std::uint64_t number = 0; number < view.domain(); ++number) {
        all.push_back(number);
        if (number % 3 == 0) some.push_back(number);
    }
    for (const Numbers& numbers : {Numbers{}, some, all})
        EXPECT_EQ(view.indicesOf(numbers), indicesByScan(view, numbers));
}

TEST(View, StartsAsTheWholeList) {
    const View view(3);
    EXPECT_TRUE(view.isWhole());
    EXPECT_EQ(view.start(), 0U);
    EXPECT_EQ(numbersOf(view), (Numbers{0, 1, 2}));
    expectInverse(view);
}

TEST(View, SlicesOfSlicesAreOneStep) {
    const View slice = View(20).sliced(19, -2, 10).sliced(1, 3, 3);
    EXPECT_EQ(numbersOf(slice), (Numbers{17, 11, 5}));
    EXPECT_EQ(slice.steps().size(), 1U);
    EXPECT_EQ(slice.start(), std::nullopt);
    expectInverse(slice);
    const View run = View(20).sliced(5, 1, 10).sliced(2, 1, 4);
    EXPECT_EQ(run.start(), 7U);
    EXPECT_TRUE(View(5).sliced(0, 1, 5).isWhole());
}

TEST(View, HugeStepsOfShortSlicesDoNotOverflow) {
    constexpr std::int64_t huge = std::int64_t{1} << 62;
    const View one = View(9).sliced(8, -2, 5).sliced(1, huge, 1);
    EXPECT_EQ(numbersOf(one.sliced(0, huge, 1)), (Numbers{6}));
    EXPECT_EQ(numbersOf(one.sliced(1, huge, 0)), Numbers{});
}

TEST(View, SelectionsMayRepeatAndAreChecked) {
    const View view = selected(View(5).sliced(1, 1, 4), {3, 0, 3});
    EXPECT_EQ(numbersOf(view), (Numbers{4, 1, 4}));
    EXPECT_EQ(view.indicesOf({4}), (Numbers{0, 2}));
    EXPECT_GE(view.heapBytes(), 3 * sizeof(std::uint64_t));
    EXPECT_THROW(selected(View(5), {5}), std::out_of_range);
}

TEST(View, AStopEndsTheInverse) {
    std::stop_source stop;
    const auto indices = [&](const View& view) {
        return view.indicesOf({0, 1, 2}, stop.get_token()).size();
    };
    const View order = View(3).shuffled(1);
    const View selection = selected(View(3), {2, 1});
    EXPECT_EQ(indices(order), 3);
    EXPECT_EQ(indices(selection), 2);
    stop.request_stop();
    EXPECT_EQ(indices(order), 0);
    EXPECT_EQ(indices(selection), 0);
}

TEST(View, RandomStepsHaveAnInverse) {
    std::mt19937_64 random(20);
    for (unsigned run = 0; run < 300; ++run) {
        View view(random() % 40);
        for (unsigned step = 0; step < 4; ++step) {
            const std::uint64_t size = view.size();
            if (random() % 3 == 0)
                view = view.shuffled(random());
            else if (random() % 2 == 0 && size > 1)
                view = view.sliced(
                    size - 1, -1 - static_cast<int>(random() % 2), size / 2);
            else if (size > 0)
                view = selected(view, {random() % size, random() % size, 0});
            expectInverse(view);
        }
    }
}

}  // namespace
