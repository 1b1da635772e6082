#pragma once

#include <cstdint>
#include <string>

#include "archive/PathArchive.hpp"
#include "hosts/console/LengthCounts.hpp"
#include "hosts/console/ProgressBar.hpp"

namespace tessel::console {

// What `tessel info` says about an archive.
struct ArchiveReport {
    std::string file;
    ArchiveInfo info;
    std::uint64_t textBytes = 0;  // with one separator per path
    std::uint64_t folders = 0;    // different ones in the whole archive
    std::uint64_t repeats = 0;    // paths that are the same as one before
    LengthCounts lengths;

    // `bytes` per path; 0 if there is none.
    double perPath(std::uint64_t bytes) const noexcept {
        return info.paths == 0 ? 0
                               : static_cast<double>(bytes) /
                                     static_cast<double>(info.paths);
    }
};

// Reads all paths, those of an unsorted list twice.
ArchiveReport reportOn(const PathArchive& archive, std::string file,
                       ProgressBar& bar);

// The report as a table for people and as JSON. Both end with a newline.
std::string tableOf(const ArchiveReport& report);
std::string jsonOf(const ArchiveReport& report);

}  // namespace tessel::console
