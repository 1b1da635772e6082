#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "archive/Format.hpp"
#include "archive/Segment.hpp"
#include "archive/SumTree.hpp"
#include "tests/archive/Archives.hpp"

namespace archives {

// A segment whose head or body was changed and whose checksums were mended, so
// that only the format's rules can tell.
class ChangedSegment {
public:
    using SegmentHead = tessel::archive::SegmentHead;

    // change  called with the head and the bytes of the body
    template <class Change>
    ChangedSegment(const Paths& paths, Change change)
        : ChangedSegment(archiveOf(paths), change) {}

    template <class Change>
    ChangedSegment(const Paths& paths, const tessel::ArchiveOptions& options,
                   Change change)
        : ChangedSegment(archiveOf(paths, options), change) {}

    // The first segment of an archive.
    template <class Change>
    ChangedSegment(const Bytes& archive, Change change) {
        entry_ = firstEntry(archive);
        const auto segment =
            std::span(archive).subspan(entry_.offset, entry_.bytes);
        SegmentHead head = SegmentHead::unpack(segment);
        const auto stored = segment.last(head.bodyBytes());
        Bytes body(stored.begin(), stored.end());
        change(head, body);
        pack(head, body);
    }

    const Bytes& bytes() const noexcept { return bytes_; }
    const tessel::archive::SegmentEntry& entry() const noexcept {
        return entry_;
    }

private:
    void pack(SegmentHead& head, const Bytes& body) {
        using tessel::archive::SumTree;
        std::vector<std::uint64_t> sums;
        while (sums.size() << head.pieceShift < body.size())
            sums.push_back(
                SumTree::pieceSum(body, head.pieceShift, 0, sums.size()));
        const auto levels = SumTree::levelsAbove(sums, head.pieceShift);
        head.topSum = levels.top;
        head.pack(bytes_);
        bytes_.insert(bytes_.end(), levels.stored.begin(), levels.stored.end());
        bytes_.insert(bytes_.end(), body.begin(), body.end());
        entry_.bytes = bytes_.size();
    }

    Bytes bytes_;
    tessel::archive::SegmentEntry entry_;
};

// A change of one byte of a section.
inline auto flip(tessel::archive::Section section, std::uint64_t offset,
                 std::uint8_t bits) {
    return [=](const tessel::archive::SegmentHead& head, Bytes& body) {
        body[head.offsetOf(section) + offset] ^= bits;
    };
}

}  // namespace archives
