#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "paths/PathList.hpp"

// Lists of paths for tests.
namespace support {

inline tessel::paths::PathList listOf(const std::vector<std::string>& paths) {
    tessel::paths::PathList list;
    for (const std::string& path : paths) list.append(path);
    return list;
}

inline std::vector<std::string> stringsOf(const tessel::paths::PathList& list) {
    std::vector<std::string> strings;
    for (std::size_t i = 0; i < list.size(); ++i) strings.emplace_back(list[i]);
    return strings;
}

}  // namespace support
