#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "archive/FunctionRef.hpp"
#include "archive/NumberRange.hpp"
#include "archive/PathArchive.hpp"

namespace tessel::console {

// ListReader reads neighbouring paths of an archive as one text, on all cores:
// each path and a separator after it, in the order of their numbers.
//
// Ownership: borrows the archive.
// Errors: what the archive throws, after all paths before the damage have been
//   shown.
// Cost: chunks of 4,096 paths, a few per core, are in memory. Of a chunk that
//   has more than 4 MiB of text, the rest is read path by path.
class ListReader {
public:
    // Shows a text and how many paths it has.
    using Show = FunctionRef<void(std::string_view text, std::uint64_t paths)>;

    ListReader(const PathArchive& archive, char separator)
        : archive_(&archive), separator_(separator) {}

    // Shows the paths of these numbers.
    void read(const NumberRange& range, Show show) const;

private:
    // The text of the first paths of a chunk, up to the number `end`.
    struct Piece {
        std::string text;
        std::uint64_t end = 0;
    };

    void fill(const NumberRange& chunk, Piece& piece) const;
    void show(const NumberRange& chunk, const Piece& piece, Show show) const;

    const PathArchive* archive_;
    char separator_;
};

}  // namespace tessel::console
