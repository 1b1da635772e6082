#include "archive/PieceVerifier.hpp"

#include <algorithm>
#include <vector>

#include "archive/ArchiveExceptions.hpp"
#include "archive/BitLoad.hpp"
#include "archive/SumTree.hpp"

namespace tessel::archive {
namespace {

// Numbers of checksums of the stored levels, level 0 first.
std::vector<std::uint64_t> storedLevels(std::uint64_t bodyPieces,
                                        unsigned pieceShift) {
    std::vector<std::uint64_t> counts;
    for (std::uint64_t count = bodyPieces; count > 1;
         count = SumTree::piecesIn(8 * count, pieceShift))
        counts.push_back(count);
    return counts;
}

}  // namespace

PieceVerifier::PieceVerifier(std::span<const std::uint8_t> segment,
                             const SegmentHead& head, std::uint64_t inArchive)
    : body_(segment.last(head.bodyBytes())),
      topSum_(head.topSum),
      pieceShift_(head.pieceShift),
      pieceCount_(SumTree::piecesIn(body_.size(), pieceShift_)),
      bodyInArchive_(inArchive + segment.size() - body_.size()) {
    verifyLevels(
        segment.subspan(segmentHeadBytes,
                        segment.size() - segmentHeadBytes - body_.size()),
        inArchive + segmentHeadBytes);
    sound_ = std::make_unique<Word[]>((pieceCount_ + 63) / 64);
}

// From the top down, so that each level is compared with sound checksums.
void PieceVerifier::verifyLevels(std::span<const std::uint8_t> levels,
                                 std::uint64_t levelsInArchive) {
    const auto counts = storedLevels(pieceCount_, pieceShift_);
    const std::uint64_t pieceBytes = std::uint64_t{1} << pieceShift_;
    std::span<const std::uint8_t> sums;  // of the pieces of the next level
    for (std::uint64_t level = counts.size(); level-- > 0;) {
        const auto table = levels.first(8 * counts[level]);
        for (std::uint64_t start = 0; start < table.size();
             start += pieceBytes) {
            const std::uint64_t i = start >> pieceShift_;
            const std::uint64_t sum =
                sums.empty() ? topSum_
                             : loadLittle<std::uint64_t>(&sums[8 * i]);
            const auto piece = table.subspan(
                start,
                std::min<std::uint64_t>(pieceBytes, table.size() - start));
            if (sumOf(piece, SumTree::seedOf(level + 1, i)) != sum)
                throw DamagedArchiveException(
                    levelsInArchive + start,
                    "A table of checksums does not match its checksum.");
        }
        sums = table;
        levels = levels.subspan(table.size());
        levelsInArchive += table.size();
    }
    pieceSums_ = sums;
}

std::uint64_t PieceVerifier::sizeOf(std::uint64_t piece) const noexcept {
    return std::min<std::uint64_t>(std::uint64_t{1} << pieceShift_,
                                   body_.size() - startOf(piece));
}

bool PieceVerifier::isSound(std::uint64_t piece) const noexcept {
    const std::uint64_t sum =
        pieceSums_.empty() ? topSum_
                           : loadLittle<std::uint64_t>(&pieceSums_[8 * piece]);
    const auto bytes = body_.subspan(startOf(piece), sizeOf(piece));
    return sumOf(bytes, SumTree::seedOf(0, piece)) == sum;
}

void PieceVerifier::verify(std::uint64_t piece) const {
    if (!isSound(piece))
        throw DamagedArchiveException(inArchive(startOf(piece)),
                                      "A piece does not match its checksum.");
    sound_[piece / 64].fetch_or(std::uint64_t{1} << (piece % 64),
                                std::memory_order_relaxed);
}

}  // namespace tessel::archive
