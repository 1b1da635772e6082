#pragma once

#include <cstdint>

#include "pathtree/NodeWalk.hpp"

namespace tessel {

// Node codes of the stored path tree, one byte per node:
//
//   code | has children | is its parent's last child
//   -----+--------------+----------------------------
//     0  |      no      |            yes
//     1  |      yes     |            yes
//     2  |      no      |            no
//     3  |      yes     |            no
//
// Never change them: written forms hold them.
namespace nodecode {
constexpr std::uint8_t hasChildren = 1;     // bit 0
constexpr std::uint8_t siblingFollows = 2;  // bit 1
constexpr std::uint8_t maxCode = hasChildren | siblingFollows;

// The code of the node that the walk is at.
inline std::uint8_t of(const NodeWalk& walk) noexcept {
    return static_cast<std::uint8_t>(
        (walk.isLeaf() ? 0U : hasChildren) |
        (walk.isLastChild() ? 0U : siblingFollows));
}
}  // namespace nodecode

}  // namespace tessel
