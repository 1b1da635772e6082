#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "archive/PackedNumbers.hpp"
#include "archive/PathBatch.hpp"
#include "archive/PathCursor.hpp"
#include "archive/PathVisitor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// ScatteredReader reads many paths of one segment whose places lie anywhere.
// Where the places ascend, it decodes the paths one after the other, those
// that lie close together on from each other. Otherwise it decodes them in
// batches.
//
// Numbers are those of the archive and must be in the segment.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
// Cost: that of a batch.
class ScatteredReader {
public:
    explicit ScatteredReader(const Segment& segment);

    // Shows the paths of these numbers in this order. False if the visitor
    // ended the visit. Throws DamagedArchiveException.
    bool read(std::span<const std::uint64_t> numbers, PathVisitor visitor);
    bool read(std::uint64_t first, std::uint64_t last, PathVisitor visitor);

private:
    template <class NumberAt>
    bool readAll(std::uint64_t count, NumberAt numberAt, PathVisitor visitor);
    template <class NumberAt>
    void findPlaces(std::uint64_t count, NumberAt numberAt);
    template <class NumberAt>
    bool showAscending(NumberAt numberAt, PathVisitor visitor);
    template <class NumberAt>
    bool showBatch(NumberAt numberAt, PathVisitor visitor);
    void prefetch(std::size_t i) const noexcept;

    const Segment& segment_;
    PackedNumbers order_;
    PathCursor paths_;
    PathBatch batch_;
    std::uint32_t perBlock_;
    bool inPlace_;
    std::vector<std::uint32_t> places_;  // of the paths that come next
};

}  // namespace tessel::archive
