#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "fuzz/Input.hpp"

namespace tessel::fuzz {

using Paths = std::vector<std::string>;

// A path is what comes up to a NUL byte; one in four repeats a part of the
// path before.
inline Paths pathsFrom(Input& input) {
    Paths paths;
    std::string path;
    while (!input.empty()) {
        const char byte = static_cast<char>(input.byte());
        if (byte != '\0') {
            path.push_back(byte);
            continue;
        }
        const std::uint8_t shared = input.byte();
        if (!path.empty()) paths.push_back(path);
        path.resize(shared % 4 == 0
                        ? std::min<std::size_t>(shared / 4, path.size())
                        : 0);
    }
    if (!path.empty()) paths.push_back(path);
    return paths;
}

// Each way of reading a store or an archive must give these paths.
template <class List>
void requireHeld(const List& list, const Paths& paths) {
    require(list.size() == paths.size(), "the count is the list's");
    std::size_t at = 0;
    for (const std::string_view path : list)
        require(at < paths.size() && path == paths[at++],
                "iteration gives the list");
    require(at == paths.size(), "iteration gives all of the list");
    std::vector<decltype(list.size())> numbers;
    for (std::size_t i = paths.size(); i > 0; --i) {
        require(list[i - 1] == paths[i - 1], "a number gives its path");
        numbers.push_back(i - 1);
    }
    list.read(numbers, [&](std::size_t number, std::string_view path) {
        require(number == --at, "numbers are answered in the order asked");
        require(path == paths[number], "many numbers give their paths");
    });
    require(at == 0, "each number is answered");
}

// The tree's order of a store must have each of these paths as often as the
// list.
template <class Store>
void requireInTree(const Store& store, Paths paths) {
    Paths met;
    store.forEachInTreeOrder(
        [&](std::string_view path) { met.emplace_back(path); });
    std::ranges::sort(met);
    std::ranges::sort(paths);
    require(met == paths, "the tree has every path");
}

}  // namespace tessel::fuzz
