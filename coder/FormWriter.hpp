#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "coder/PathNumbering.hpp"
#include "packing/sixpacks.hpp"
#include "pathtree/BPathTree.hpp"

namespace tessel {

// Appends the payload of a coder's stored form (HuffmanPathTreeForm.cpp has its
// layout). Each width follows from the maximum that the coder keeps for the
// group, or from a larger value that is really there: no value loses bytes.
//
// Ownership: borrows all that it is given, which must not change meanwhile.
// Cost: two walks over the tree and two over the tracks. If it throws
//   (std::bad_alloc), part of the payload has been appended.
class FormWriter {
public:
    FormWriter(const BPathTree& tree, const PathNumbering& numbering,
               std::vector<std::uint8_t>& out);

    // The shape is that of the code's tree.
    void write(const std::vector<bool>& shape);

private:
    // What the writer must know of a path tree before it writes.
    struct TreeStats {
        std::size_t nodes = 0;
        std::size_t valueBytes = 0;
        std::size_t maxValueBytes = 0;
        std::size_t maxChildren = 0;

        static TreeStats collect(const BPathTree& tree);
    };

    // The largest position and the greatest length of some tracks.
    struct TrackMaxima {
        std::uint64_t position = 0;
        std::uint64_t length = 0;

        void add(const PathTrack& track);
    };

    struct TrackWidths {
        sixpacks::PackedSizeT position;
        sixpacks::PackedSizeT length;
    };

    void writeShape(const std::vector<bool>& shape);
    void writeTree();
    void writePartitions();
    void writeDuplicates();
    TrackWidths writeWidths(const TrackMaxima& maxima);
    void writeTrack(const PathTrack& track, TrackWidths widths);

    const BPathTree& tree_;
    const PathNumbering& numbering_;
    const TreeStats stats_;
    std::vector<std::uint8_t>& out_;
};

}  // namespace tessel
