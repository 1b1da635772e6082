#pragma once

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

}  // namespace stores
