#include "hosts/console/ListReader.hpp"

#include <fmt/format.h>

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
    const ScanOptions options;
    archive::OrderedScan scan(archive::chunkCount(range, pathsPerChunk),
                              options);
    std::vector<Piece> pieces(scan.slots());
    const auto chunkAt = [&](std::uint64_t c) {
        return archive::chunkOf(range, pathsPerChunk, c);
    };
    scan.run(
        [&](std::uint64_t c) { fill(chunkAt(c), pieces[c % scan.slots()]); },
        [&](std::uint64_t c) {
            this->show(chunkAt(c), pieces[c % scan.slots()], show);
            return true;
        });
}

void ListReader::append(std::uint64_t number, std::string_view path,
                        std::string& text) const {
    if (numbering_ == Numbering::Numbers) {
        const fmt::format_int digits(number);
        text.append(digits.data(), digits.size()).push_back('\t');
    }
    text.append(path).push_back(separator_);
}

// Damage ends the piece but is not reported yet: `show` reads the rest of the
// chunk again, after the paths before the damage, and throws there.
void ListReader::fill(const NumberRange& chunk, Piece& piece) const {
    piece.text.clear();
    piece.end = chunk.begin;
    try {
        archive_->forEach(chunk.begin, chunk.end,
                          [&](std::uint64_t number, std::string_view path) {
                              if (piece.text.size() > maxChunkText)
                                  return false;
                              append(number, path, piece.text);
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
    std::string record;
    archive_->forEach(piece.end, chunk.end,
                      [&](std::uint64_t number, std::string_view path) {
                          record.clear();
                          append(number, path, record);
                          show(record, 1);
                      });
}

}  // namespace tessel::console
