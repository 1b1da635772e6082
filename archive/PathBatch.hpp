#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "archive/PathCursor.hpp"
#include "archive/Segment.hpp"

namespace tessel::archive {

// PathBatch reads many paths of one segment whose places lie anywhere. It
// decodes them in the order of their places, so that neighbours share the
// decoding of their blocks and the processor finds the next bytes in its
// cache, and keeps their texts until they are asked for.
//
// Each batch is larger than the one before, so that a caller who wants only a
// few paths does not pay for many.
//
// Ownership: borrows the segment.
// Threads: one thread at a time.
// Cost: at most 8 MiB of text and 2 MiB of places. Measured on a shuffled list
//   of a million paths: batches of 65,536 take half of the time of reading the
//   paths one by one, batches of 4,096 seven tenths.
class PathBatch {
public:
    explicit PathBatch(const Segment& segment) : segment_(&segment) {}

    // The most paths that the next fill() takes.
    std::size_t room() const noexcept { return room_; }

    // Decodes the paths at some of these places: from the first on, at least
    // one, at most room(). They replace those of the last call.
    //
    // places  not empty, each below the segment's size
    //
    // Throws DamagedArchiveException for the first path only: damage to any
    // other one waits until that comes first.
    void fill(std::span<const std::uint32_t> places);

    std::size_t size() const noexcept { return texts_.size(); }

    // Valid until the next fill().
    std::string_view operator[](std::size_t i) const noexcept {
        return std::string_view(text_).substr(texts_[i].begin,
                                              texts_[i].length);
    }

private:
    static constexpr std::size_t firstRoom = 16;
    static constexpr std::size_t maxRoom = 65536;
    static constexpr std::size_t maxTextBytes = std::size_t{8} << 20;

    struct Text {
        std::uint32_t begin;
        std::uint32_t length;
    };

    void sortByPlace(std::span<const std::uint32_t> places);
    void sortByDigits(unsigned shift);
    bool decode(std::span<const std::uint32_t> places);
    void prefetch(std::size_t next) const noexcept;

    const Segment* segment_;
    std::size_t room_ = firstRoom;
    std::size_t limit_ = maxRoom;       // room_ grows up to it
    std::vector<std::uint64_t> order_;  // place and, below it, index
    std::vector<std::uint64_t> sorting_;
    std::vector<Text> texts_;
    std::string text_;
};

}  // namespace tessel::archive
