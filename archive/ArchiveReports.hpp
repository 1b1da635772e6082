#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "archive/NumberRange.hpp"

namespace tessel {

// One stretch of an archive's bytes that is not what was written.
struct ArchiveDamage {
    std::uint64_t offset = 0;  // in the archive
    std::uint64_t size = 0;    // bytes; 0 if only a place is known
    std::string what;          // a sentence

    friend bool operator==(const ArchiveDamage&,
                           const ArchiveDamage&) = default;
};

// What PathArchive::salvage could and could not read.
struct SalvageReport {
    std::uint64_t kept = 0;         // paths shown to the visitor
    std::vector<NumberRange> lost;  // ascending, disjoint
    std::vector<ArchiveDamage> damages;

    // Whether it is known how many paths there were. If it is not, there may
    // have been more after the last number kept or lost.
    bool complete = true;
};

// Facts about an archive. The bytes of all sections add up to fileBytes.
struct ArchiveInfo {
    struct Section {
        std::string name;  // such as "names"
        std::uint64_t bytes = 0;
    };

    std::uint32_t formatVersion = 0;
    std::uint64_t paths = 0;
    std::uint64_t folders = 0;  // different ones of each segment, added up
    std::uint64_t segments = 0;
    std::uint64_t sortedSegments = 0;  // of those, whose paths are in order
    std::uint64_t textBytes = 0;       // of all paths, without separators
    std::uint64_t fileBytes = 0;
    std::uint64_t longestName = 0;    // bytes after the last '/'
    std::uint64_t longestFolder = 0;  // bytes up to and with the last '/'
    std::vector<Section> sections;    // added up over the segments

    // A checksum of the segments' heads. They hold checksums of all else, so
    // it covers everything stored: archives of equal bytes have equal sums. Two
    // archives that differ by accident have equal sums with a probability of
    // about 2^-64.
    std::uint64_t sum = 0;
};

}  // namespace tessel
