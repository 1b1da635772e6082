#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "paths/PathStore.hpp"

// What a store gives back, for tests.
namespace stores {

// In the order of addition.
inline std::vector<std::string> iterated(const tessel::PathStore& store) {
    std::vector<std::string> paths;
    for (const std::string_view path : store) paths.emplace_back(path);
    return paths;
}

inline std::vector<std::string> inTreeOrder(const tessel::PathStore& store) {
    std::vector<std::string> paths;
    store.forEachInTreeOrder(
        [&paths](std::string_view path) { paths.emplace_back(path); });
    return paths;
}

// By numbers, from the first to the last.
inline std::vector<std::string> readAll(const tessel::PathStore& store) {
    std::vector<std::string> paths;
    store.read(0, store.size(), [&](std::size_t number, std::string_view path) {
        EXPECT_EQ(number, paths.size());
        paths.emplace_back(path);
    });
    return paths;
}

inline std::vector<std::string> sorted(std::vector<std::string> paths) {
    std::sort(paths.begin(), paths.end());
    return paths;
}

// By a list of numbers, the last one first.
inline std::vector<std::string> readFromTheLast(
    const tessel::PathStore& store) {
    std::vector<std::size_t> numbers(store.size());
    for (std::size_t i = 0; i < numbers.size(); ++i)
        numbers[i] = numbers.size() - 1 - i;
    std::vector<std::string> paths;
    store.read(numbers, [&](std::size_t number, std::string_view path) {
        EXPECT_EQ(number, numbers[paths.size()]);
        paths.emplace_back(path);
    });
    return paths;
}

// Asks the store in every way that it has.
inline void expectHolds(const tessel::PathStore& store,
                        const std::vector<std::string>& paths) {
    ASSERT_EQ(store.size(), paths.size());
    EXPECT_EQ(store.empty(), paths.empty());
    EXPECT_EQ(readAll(store), paths);
    EXPECT_EQ(readFromTheLast(store),
              std::vector<std::string>(paths.rbegin(), paths.rend()));
    EXPECT_EQ(iterated(store), paths);
    EXPECT_EQ(sorted(inTreeOrder(store)), sorted(paths));
    for (std::size_t i = 0; i < paths.size(); ++i)
        ASSERT_EQ(store[i], paths[i]);
    EXPECT_THROW(store[paths.size()], std::out_of_range);
    EXPECT_EQ(readAll(tessel::PathStore::load(store.save())), paths);
}

}  // namespace stores
