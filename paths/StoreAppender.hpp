#pragma once

#include <cstddef>
#include <future>
#include <string_view>
#include <vector>

#include "paths/ChunkEncoder.hpp"
#include "paths/PathList.hpp"

namespace tessel {

class HuffmanPathTree;

}  // namespace tessel

namespace tessel::paths {

// StoreAppender adds paths to a store's coder, a chunk at a time. The coder
// must have a code for all their characters.
//
// A chunk is encoded on other threads while the one before is inserted on the
// caller's, where all of the coder's memory comes from.
//
// Ownership: keeps a reference to the coder.
// Threads: works on as many as the hardware runs. What is added does not
//   depend on their number.
// Cost: at most a chunk's text and two chunks' encoded names, see the limits.
class StoreAppender {
public:
    explicit StoreAppender(HuffmanPathTree& coder,
                           std::size_t pathsPerChunk = maxPathsPerChunk)
        : coder_(&coder), pathsPerChunk_(pathsPerChunk) {}

    // Adds the path, now or later. It must not be empty.
    void add(std::string_view path);
    // Adds what is still to be added.
    void finish();

    // Paths and bytes after which a chunk is added. Each chunk finds its
    // folders in the tree anew, so chunks should be long; a chunk of this
    // length takes about a tenth of what a list of millions takes.
    static constexpr std::size_t maxPathsPerChunk = 250'000;
    static constexpr std::size_t maxBytesPerChunk = std::size_t{1} << 25U;

    // True if the coder may have been changed.
    bool hasStarted() const noexcept { return hasStarted_; }
    std::size_t pathCount() const noexcept { return pathCount_; }

private:
    void addChunk();
    EncodedChunk encoded() const;
    std::future<EncodedChunk> begunEncoding() const;
    // Inserts the chunk that waits, if there is one.
    void insertWaiting();

    HuffmanPathTree* coder_;
    std::size_t pathsPerChunk_;
    PathList chunk_;
    EncodedChunk waiting_;  // encoded, to be inserted
    std::size_t pathCount_ = 0;
    bool hasStarted_ = false;
};

}  // namespace tessel::paths
