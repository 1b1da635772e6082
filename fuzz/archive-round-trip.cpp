// Any list of paths comes back from an archive as it went in, whatever the
// options, and each operation finds what a plain vector holds.
#include <algorithm>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "fuzz/Input.hpp"

namespace {

using namespace tessel;
using Paths = std::vector<std::string>;

ArchiveOptions optionsFrom(fuzz::Input& input) {
    ArchiveOptions options;
    const std::uint8_t choice = input.byte();
    options.level = static_cast<ArchiveLevel>(choice % 3);
    if ((choice & 0x10) != 0) options.index = ArchiveIndex::WhereNeeded;
    if ((choice & 0x20) != 0) options.pathsPerSegment = 1 + choice % 16;
    options.threads = (choice & 0x40) != 0 ? 2 : 1;
    return options;
}

// A path is what comes up to a NUL byte; one in four repeats a part of the
// path before.
Paths pathsFrom(fuzz::Input& input) {
    Paths paths;
    std::string path;
    while (!input.empty()) {
        const char byte = static_cast<char>(input.byte());
        if (byte != '\0') {
            path.push_back(byte);
            continue;
        }
        const std::uint8_t shared = input.byte();
        if (!path.empty()) paths.push_back(path);
        path.resize(shared % 4 == 0
                        ? std::min<std::size_t>(shared / 4, path.size())
                        : 0);
    }
    if (!path.empty()) paths.push_back(path);
    return paths;
}

void require(const std::vector<std::uint8_t>& bytes, const Paths& paths) {
    const PathArchive archive = PathArchive::over(bytes);
    fuzz::require(archive.size() == paths.size(), "the count is the list's");
    std::size_t at = 0;
    for (const std::string_view path : archive)
        fuzz::require(path == paths[at++], "iteration gives the list");
    for (std::size_t i = 0; i < paths.size(); ++i) {
        fuzz::require(archive[i] == paths[i], "a number gives its path");
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
    Paths paths = pathsFrom(input);
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
