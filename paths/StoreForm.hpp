#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace tessel {

class HuffmanPathTree;

}  // namespace tessel

namespace tessel::paths {

// The saved form of a store: an envelope around a coder's stored form.
//
//   bytes  field
//   8      89 'T' 'E' 'S' 'S' 'E' 'L' 0A
//   4      version, 1
//   4      n, code units of the tree string
//   2 n    the tree string
//   8      m, bytes of the stored form
//   m      the coder's stored form, compressed
//   4      CRC-32 of all bytes before it
//
// Integers are little-endian.
std::vector<std::uint8_t> packStore(const HuffmanPathTree& coder);

// The coder that was packed. Bytes may be hostile: throws
// DamagedFormException, or UnsupportedStoreVersionException if the version is
// a later one. What it answers has one track and one end per partition, ends
// that ascend up to its number of paths, no duplicates, and no code or one of
// several characters; it may still hold tracks that lead nowhere and names
// that are no path's.
std::unique_ptr<HuffmanPathTree> unpackStore(
    std::span<const std::uint8_t> bytes);

}  // namespace tessel::paths
