#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "archive/NumberRange.hpp"
#include "archive/PathArchive.hpp"
#include "hosts/console/PathOutput.hpp"
#include "packing/FunctionRef.hpp"

namespace tessel::console {

// ListReader reads all paths of a range of numbers on all cores and turns them
// into the text that a listing writes: one record per path, as PathOutput has
// it, in the order of the numbers. The text comes in pieces.
//
// Ownership: borrows the archive.
// Errors: what the archive throws, after all paths before the damage have been
//   shown.
// Cost: a few chunks of 4,096 paths per core are in memory at a time. If a
//   chunk has more than 4 MiB of text, only its first 4 MiB are kept, and the
//   paths after that are read one by one, so that long paths do not fill the
//   memory.
class ListReader {
public:
    // Gets a piece of text and how many paths it has.
    using Show = FunctionRef<void(std::string_view text, std::uint64_t paths)>;

    ListReader(const PathArchive& archive, Separator separator,
               Numbering numbering)
        : archive_(&archive),
          separator_(static_cast<char>(separator)),
          numbering_(numbering) {}

    void read(const NumberRange& range, Show show) const;

private:
    // The text of the first paths of a chunk, up to the number `end`.
    struct Piece {
        std::string text;
        std::uint64_t end = 0;
    };

    void append(std::uint64_t number, std::string_view path,
                std::string& text) const;
    void fill(const NumberRange& chunk, Piece& piece) const;
    void show(const NumberRange& chunk, const Piece& piece, Show show) const;

    const PathArchive* archive_;
    char separator_;
    Numbering numbering_;
};

}  // namespace tessel::console
