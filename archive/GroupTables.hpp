#pragma once

#include <cstdint>
#include <vector>

#include "archive/BlockWriter.hpp"

namespace tessel::archive {

// The sections that say where each block is.
struct GroupTables {
    std::vector<std::uint8_t> names;
    std::vector<std::uint8_t> folders;
    std::vector<std::uint8_t> wide;
};

// The groups of all chunks, in order. A group of 16 blocks is
//
//   | offset, bit 31: wide (u32) | folders before (u32, names only)
//   | 16 new folders (bytes, names only) | 16 lengths (bytes) |
//
// If a length is above 255, bit 31 of the offset is set, and the 16 lengths are
// in an entry of `wide`, 16 u32. The first 4 of the 16 bytes are the index of
// that entry then (u32).
// Throws std::length_error if the blocks take 2 GiB or more.
GroupTables packGroups(const std::vector<Blocks>& nameChunks,
                       const std::vector<Blocks>& folderChunks);

}  // namespace tessel::archive
