#include "tests/archive/Archives.hpp"

#include <map>
#include <tuple>

namespace archives {

namespace {

using tessel::ArchiveOptions;

Bytes packed(const Paths& paths, const ArchiveOptions& options) {
    Bytes bytes;
    tessel::ArchiveWriter writer(bytes, options);
    writer.addAll(paths);
    writer.finish();
    return bytes;
}

// All that the bytes may depend on, and the threads besides.
auto keyOf(const Paths& paths, const ArchiveOptions& options) {
    return std::tuple(paths, options.level, options.index, options.threads,
                      options.pathsPerSegment, options.textPerSegment);
}

}  // namespace

Bytes archiveOf(const Paths& paths, const ArchiveOptions& options) {
    if (options.progress || options.cancel.stop_possible())
        return packed(paths, options);
    static std::map<decltype(keyOf(paths, options)), Bytes> known;
    const auto [entry, isNew] = known.try_emplace(keyOf(paths, options));
    if (isNew) entry->second = packed(paths, options);
    return entry->second;
}

}  // namespace archives
