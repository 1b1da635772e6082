#pragma once

#include <cstdint>
#include <functional>
#include <stop_token>

namespace tessel {

// How work over a whole archive is done.
struct ScanOptions {
    // Most threads to use, the calling one included; 0 is one per core. No
    // result depends on it.
    unsigned threads = 0;

    // A request to stop ends the work with CancelledException.
    std::stop_token cancel;

    // Called on the calling thread, ten times per second at most, with how
    // many of how many units of work are done. What it throws ends the work
    // and reaches the caller.
    std::function<void(std::uint64_t done, std::uint64_t total)> progress;
};

}  // namespace tessel
