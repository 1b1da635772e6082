#pragma once

#include <cstdint>
#include <cstring>
#include <span>
#include <vector>

namespace tessel {

// The bytes of one encoded component, borrowed.
using ComponentView = std::span<const std::uint8_t>;

// An encoded component, and a list of them: a folder's components, a batch
// of file names, or a whole path with the file name last.
using Component = std::vector<std::uint8_t>;
using Components = std::vector<Component>;

// Equal length and equal bytes.
inline bool sameComponent(ComponentView a, ComponentView b) noexcept {
    return a.size() == b.size() &&
           (a.empty() || std::memcmp(a.data(), b.data(), a.size()) == 0);
}

}  // namespace tessel
