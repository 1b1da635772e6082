#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "archive/FunctionRef.hpp"
#include "archive/PackedNumbers.hpp"
#include "archive/PathCursor.hpp"
#include "archive/PathVisitor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// ScatteredReader reads many paths of one segment whose places lie anywhere.
// It looks some paths ahead and asks the processor for their bytes, so that
// their ways through the memory overlap. Paths that lie close together are
// decoded on from each other instead.
//
// Numbers are those of the archive and must be in the segment.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
class ScatteredReader {
public:
    explicit ScatteredReader(const Segment& segment);

    // Shows the paths of these numbers in this order. False if the visitor
    // ended the visit. Throws DamagedArchiveException.
    bool read(std::span<const std::uint64_t> numbers, PathVisitor visitor);
    bool read(std::uint64_t first, std::uint64_t last, PathVisitor visitor);

private:
    // Paths between the first look at a path's place and its decoding. Eight
    // suffice to hide the memory's latency: the decoding of one path takes as
    // long as one access.
    static constexpr std::size_t lookahead = 8;

    struct Coming {
        std::uint64_t place = 0;
        bool isFar = false;  // from the path before
    };

    template <class NumberAt>
    bool readAll(std::uint64_t count, NumberAt numberAt, PathVisitor visitor);
    void announce(std::uint64_t index, std::uint64_t number);
    void prefetch(std::uint64_t index, std::uint64_t count);
    Coming& coming(std::uint64_t index) noexcept {
        return coming_[index % lookahead];
    }
    std::uint32_t blockOf(std::uint64_t place) const noexcept {
        return static_cast<std::uint32_t>(place / perBlock_);
    }

    const Segment& segment_;
    PackedNumbers order_;
    PathCursor paths_;
    std::uint32_t perBlock_;
    bool inPlace_;
    std::uint64_t lastPlace_;
    std::array<Coming, lookahead> coming_{};
};

}  // namespace tessel::archive
