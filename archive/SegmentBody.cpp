#include "archive/SegmentBody.hpp"

#include <algorithm>
#include <cstddef>
#include <span>
#include <utility>

#include "archive/SumTree.hpp"

namespace tessel::archive {

namespace {

// The checksums of level 0, on all workers.
std::vector<std::uint64_t> sumPieces(std::span<const std::uint8_t> body,
                                     unsigned pieceShift, Workers& workers) {
    constexpr std::size_t piecesPerStep = 256;
    std::vector<std::uint64_t> sums(SumTree::piecesIn(body.size(), pieceShift));
    workers.run((sums.size() + piecesPerStep - 1) / piecesPerStep,
                [&](std::size_t step, unsigned) {
                    const std::size_t end =
                        std::min(sums.size(), (step + 1) * piecesPerStep);
                    for (std::size_t i = step * piecesPerStep; i < end; ++i)
                        sums[i] = SumTree::pieceSum(body, pieceShift, 0, i);
                });
    return sums;
}

}  // namespace

void SegmentBody::add(Section section, Bytes part) {
    parts_[static_cast<std::size_t>(section)].push_back(std::move(part));
}

SegmentBody::Bytes SegmentBody::finish(SegmentHead& head, Workers& workers) {
    for (std::size_t s = 0; s < sectionCount; ++s)
        for (const Bytes& part : parts_[s]) head.sectionBytes[s] += part.size();
    Bytes segment = joined(head, workers);
    const std::size_t bodyAt = segmentHeadBytes + head.sumTreeBytes();
    const auto levels = SumTree::levelsAbove(
        sumPieces(std::span(segment).subspan(bodyAt), head.pieceShift, workers),
        head.pieceShift);
    head.topSum = levels.top;
    Bytes packed;
    head.pack(packed);
    packed.insert(packed.end(), levels.stored.begin(), levels.stored.end());
    std::ranges::copy(packed, segment.begin());
    return segment;
}

// The segment with nothing but its sections.
SegmentBody::Bytes SegmentBody::joined(const SegmentHead& head,
                                       Workers& workers) {
    Bytes segment(head.segmentBytes());
    struct Copy {
        Bytes* part;
        std::size_t offset;
    };
    std::vector<Copy> copies;
    for (std::size_t s = 0; s < sectionCount; ++s) {
        std::size_t offset = segmentHeadBytes + head.sumTreeBytes() +
                             head.offsetOf(static_cast<Section>(s));
        for (Bytes& part : parts_[s]) {
            copies.push_back({&part, offset});
            offset += part.size();
        }
    }
    workers.run(copies.size(), [&](std::size_t i, unsigned) {
        Bytes part = std::exchange(*copies[i].part, {});
        std::copy(
            part.begin(), part.end(),
            segment.begin() + static_cast<std::ptrdiff_t>(copies[i].offset));
    });
    return segment;
}

}  // namespace tessel::archive
