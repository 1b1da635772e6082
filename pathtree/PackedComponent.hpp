#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "pathtree/Component.hpp"

// How a component stands in a packed list, be it a batch on its way into the
// tree (ComponentList) or a folder's children (ChildBlock), so that a batch
// becomes children by one copy of its bytes:
//
//   first byte | what follows
//   -----------+------------------------------------------------------------
//   0 to 252   | that many bytes: the component
//   253        | only among children: a folder that was a file, see ChildBlock
//   254        | the length, 8 bytes, and that many bytes: the component
//   255        | only among children: a folder, see ChildBlock
namespace tessel::packed {

constexpr std::size_t maxShortLength = 252;
constexpr std::uint8_t promotedMark = 253;
constexpr std::uint8_t longMark = 254;
constexpr std::uint8_t folderMark = 255;

// Bytes before a component of this length.
constexpr std::size_t headerBytes(std::size_t length) noexcept {
    return length <= maxShortLength ? 1 : 1 + sizeof(std::uint64_t);
}

// Writes what stands before a component of this length and returns the place
// of the component itself.
inline std::uint8_t* writeHeader(std::uint8_t* at,
                                 std::size_t length) noexcept {
    if (length <= maxShortLength) {
        *at = static_cast<std::uint8_t>(length);
        return at + 1;
    }
    const std::uint64_t stored = length;
    *at = longMark;
    std::memcpy(at + 1, &stored, sizeof stored);
    return at + 1 + sizeof stored;
}

// The component that stands at this place, which must not be a folder.
inline ComponentView readComponent(const std::uint8_t* at) noexcept {
    if (*at != longMark) return {at + 1, *at};
    std::uint64_t length = 0;
    std::memcpy(&length, at + 1, sizeof length);
    return {at + 1 + sizeof length, static_cast<std::size_t>(length)};
}

}  // namespace tessel::packed
