#pragma once

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

}  // namespace support
