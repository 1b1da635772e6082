#pragma once

#include <cstddef>
#include <cstdint>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "archive/PathArchive.hpp"
#include "tests/archive/Archives.hpp"

// Lists of paths for tests of whole archives.
namespace support {

using archives::archiveOf;
using archives::Paths;

// All paths of an archive, read from the first number to the last.
Paths pathsOf(const tessel::PathArchive& archive);

// A list whose paths share folders and parts of names, as files do.
Paths fileList(std::size_t count, std::uint32_t seed);

// Any bytes but NUL, of a few kinds so that prefixes are shared, too.
Paths randomList(std::mt19937& random, std::size_t maxCount);

struct NamedList {
    std::string_view name;
    Paths paths;
};

// Small lists that are hard on something: empty names and folders, roots,
// repeats, every byte, lengths next to each limit, orders of every kind.
std::vector<NamedList> nastyLists();

}  // namespace support
