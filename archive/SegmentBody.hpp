#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "archive/Format.hpp"
#include "archive/Workers.hpp"

namespace tessel::archive {

// Gathers the sections of a segment and joins them with head and checksums.
//
//   | head | levels of checksums, the highest first | sections | guard |
class SegmentBody {
public:
    using Bytes = std::vector<std::uint8_t>;

    // Appends to a section. Parts are joined without padding.
    void add(Section section, Bytes part);

    // The segment. `head` has all fields but the sizes and sums of the body,
    // which are set here. The parts are released on the way.
    Bytes finish(SegmentHead& head, Workers& workers);

private:
    Bytes joined(const SegmentHead& head, Workers& workers);

    std::array<std::vector<Bytes>, sectionCount> parts_;
};

}  // namespace tessel::archive
