#include "hosts/console/ListReader.hpp"

#include <algorithm>
#include <cstddef>
#include <vector>

#include "archive/OrderedScan.hpp"

namespace tessel::console {

namespace {

// About 300 KB of text, which the processor's caches keep until it is written:
// four times as much makes listing a million paths a tenth slower.
constexpr std::uint64_t pathsPerChunk = 4096;
constexpr std::size_t maxChunkText = std::size_t{4} << 20;

}  // namespace

void ListReader::read(const NumberRange& range, Show show) const {
    const std::uint64_t paths = range.end - range.begin;
    const auto chunkAt = [&](std::uint64_t c) {
        const std::uint64_t begin = range.begin + c * pathsPerChunk;
        return NumberRange{begin, std::min(begin + pathsPerChunk, range.end)};
    };
    const ScanOptions options;
    archive::OrderedScan scan((paths + pathsPerChunk - 1) / pathsPerChunk,
                              options);
    std::vector<Piece> pieces(scan.slots());
    scan.run(
        [&](std::uint64_t c) { fill(chunkAt(c), pieces[c % pieces.size()]); },
        [&](std::uint64_t c) {
            this->show(chunkAt(c), pieces[c % pieces.size()], show);
            return true;
        });
}

// Damage only ends the piece: it is met again when the rest is shown.
void ListReader::fill(const NumberRange& chunk, Piece& piece) const {
    piece.text.clear();
    piece.end = chunk.begin;
    try {
        archive_->forEach(chunk.begin, chunk.end,
                          [&](std::uint64_t number, std::string_view path) {
                              if (piece.text.size() > maxChunkText)
                                  return false;
                              piece.text.append(path);
                              piece.text.push_back(separator_);
                              piece.end = number + 1;
                              return true;
                          });
    } catch (const DamagedArchiveException&) {
        return;
    }
}

void ListReader::show(const NumberRange& chunk, const Piece& piece,
                      Show show) const {
    show(piece.text, piece.end - chunk.begin);
    if (piece.end == chunk.end) return;
    archive_->forEach(piece.end, chunk.end,
                      [&](std::uint64_t, std::string_view path) {
                          show(path, 1);
                          show({&separator_, 1}, 0);
                      });
}

}  // namespace tessel::console
