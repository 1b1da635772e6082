#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "paths/PathList.hpp"
#include "pathtree/ComponentArena.hpp"

namespace tessel {

class HuffmanCode;

}  // namespace tessel

namespace tessel::paths {

// Some consecutive paths as the coder inserts them: an entry per run of paths
// of one folder, with the folder's segments and the files' names.
struct EncodedChunk {
    std::vector<ComponentList> folders;
    std::vector<ComponentList> files;
    ComponentBuffers buffers;  // what both lists point into
    std::size_t maxComponentBytes = 0;
    std::size_t pathCount = 0;
};

// Encodes the paths on at most that many threads (0: two). The result does not
// depend on their number. Throws CodeNotFoundException if a character has no
// code.
EncodedChunk encodeChunk(const HuffmanCode& code, const PathList& paths,
                         unsigned threads);

}  // namespace tessel::paths
