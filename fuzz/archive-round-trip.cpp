// Any list of paths comes back from an archive as it went in, whatever the
// options, and each operation finds what a plain vector holds.
#include <algorithm>
#include <cstdint>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "fuzz/Input.hpp"
#include "fuzz/PathLists.hpp"

namespace {

using namespace tessel;
using fuzz::Paths;

ArchiveOptions optionsFrom(fuzz::Input& input) {
    ArchiveOptions options;
    const std::uint8_t choice = input.byte();
    options.level = static_cast<ArchiveLevel>(choice % 3);
    if ((choice & 0x10) != 0) options.index = ArchiveIndex::WhereNeeded;
    if ((choice & 0x20) != 0) options.pathsPerSegment = 1 + choice % 16;
    options.threads = (choice & 0x40) != 0 ? 2 : 1;
    return options;
}

void require(const std::vector<std::uint8_t>& bytes, const Paths& paths) {
    const PathArchive archive = PathArchive::over(bytes);
    fuzz::requireHeld(archive, paths);
    for (std::size_t i = 0; i < paths.size(); ++i) {
        const auto first = std::find(paths.begin(), paths.end(), paths[i]);
        fuzz::require(archive.numberOf(paths[i]) ==
                          static_cast<std::uint64_t>(first - paths.begin()),
                      "a path gives its first number");
    }
    archive.verify();
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    fuzz::Input input(data, std::min<std::size_t>(size, 3000));
    const ArchiveOptions options = optionsFrom(input);
    Paths paths = fuzz::pathsFrom(input);
    std::vector<std::uint8_t> bytes;
    {
        ArchiveWriter writer(bytes, options);
        writer.addAll(paths);
        writer.finish();
    }
    require(bytes, paths);
    {
        ArchiveWriter writer = ArchiveWriter::append(bytes, options);
        writer.addAll(paths);
        writer.finish();
    }
    const std::size_t count = paths.size();
    for (std::size_t i = 0; i < count; ++i) paths.push_back(paths[i]);
    require(bytes, paths);
    return 0;
}
