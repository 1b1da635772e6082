#pragma once

#include <cstddef>
#include <string_view>
#include <vector>

#include "paths/PathList.hpp"

namespace tessel {

class HuffmanPathTree;

}  // namespace tessel

namespace tessel::paths {

// StoreAppender adds paths to a store's coder, a chunk at a time. The coder
// must have a code for all their characters.
//
// Ownership: keeps a reference to the coder.
// Threads: works on as many as the hardware runs.
// Cost: a chunk's text, three times over, for as long as it is added.
class StoreAppender {
public:
    explicit StoreAppender(HuffmanPathTree& coder) : coder_(&coder) {}

    // Adds the path, now or later. It must not be empty.
    void add(std::string_view path);
    // Adds what is still to be added.
    void finish();

    // True if the coder may have been changed.
    bool hasStarted() const noexcept { return hasStarted_; }
    std::size_t pathCount() const noexcept { return pathCount_; }

private:
    HuffmanPathTree* coder_;
    PathList chunk_;
    std::size_t pathCount_ = 0;
    bool hasStarted_ = false;
};

}  // namespace tessel::paths
