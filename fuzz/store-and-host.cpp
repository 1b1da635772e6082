// One list of paths in a store, in an archive, and through the plug-in in a
// host: each gives the list back by number, many at a time, in its own order,
// and after it was stored and restored.
//
// Input: a byte of options for store and archive, and paths as PathLists.hpp
// takes them.
#include <algorithm>
#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/PathArchive.hpp"
#include "fuzz/HostInput.hpp"
#include "fuzz/PathLists.hpp"
#include "hosts/embedded/demo/HostJob.hpp"
#include "paths/PathStore.hpp"

namespace tessel::fuzz {
namespace {

// The first paths come in one call, the others in another one.
void checkStore(const Paths& paths, std::size_t firstCall) {
    const auto middle = paths.begin() + static_cast<std::ptrdiff_t>(
                                            std::min(firstCall, paths.size()));
    PathStore store = PathStore::from(Paths(paths.begin(), middle));
    store.append(Paths(middle, paths.end()));
    requireHeld(store, paths);
    const PathStore loaded = PathStore::load(store.save());
    requireHeld(loaded, paths);
    requireInTree(loaded, paths);
}

void checkArchive(const Paths& paths, const ArchiveOptions& options) {
    std::vector<std::uint8_t> bytes;
    ArchiveWriter writer(bytes, options);
    writer.addAll(paths);
    writer.finish();
    const PathArchive archive = PathArchive::over(bytes);
    requireHeld(archive, paths);
    archive.verify();
}

// HostJob compares with the list what it adds, fetches, iterates, copies, saves
// and loads.
void checkHost(const Paths& paths) {
    paths::PathList list;
    for (const std::string& path : paths) list.append(path);
    try {
        embedded::HostJob(pluggedHost(), list).run();
    } catch (const std::exception& difference) {
        require(false, difference.what());
    }
}

void run(Input input) {
    const std::uint8_t choice = input.byte();
    const Paths paths = pathsFrom(input);
    ArchiveOptions options;
    options.threads = 1;
    // archive-round-trip tries the slower ones, and smaller segments.
    options.level = ArchiveLevel::Fast;
    if (choice % 2 == 0) options.index = ArchiveIndex::WhereNeeded;
    if (choice % 4 == 0) options.pathsPerSegment = 64U + choice;
    checkStore(paths, choice / 4);
    checkArchive(paths, options);
    checkHost(paths);
}

}  // namespace
}  // namespace tessel::fuzz

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data,
                                      std::size_t size) {
    tessel::fuzz::run({data, std::min<std::size_t>(size, 3000)});
    return 0;
}
