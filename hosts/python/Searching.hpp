#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/patterns/PathMatcher.hpp"
#include "hosts/python/PathSequence.hpp"
#include "paths/PathList.hpp"

namespace tessel::python {

// What paths to find: those that hold every text, that a matcher matches if
// there is one, and that are below a folder if there is one.
struct Query {
    std::vector<std::string> texts;
    std::optional<patterns::PathMatcher> matcher;
    std::optional<std::string> folder;  // as PathArchive::folder takes it
};

// All of them work on all cores and let Ctrl-C end them; the calling thread
// holds the interpreter's lock.

// The indices of the paths that a query is after, ascending. A view of less
// than a quarter of its archive is scanned; otherwise the archive is searched.
std::vector<std::uint64_t> findPaths(const PathSequence& paths,
                                     const Query& query);

// The first index of each path asked for, or -1. Looks few of them up by
// themselves; for many, it scans the list once.
std::vector<std::int64_t> firstIndicesOf(const PathSequence& paths,
                                         const paths::PathList& asked);

// The different folders that the paths are in, in the order of their bytes:
// what is before the last '/', "" if there is none, "/" if that is the first
// byte.
std::vector<std::string> foldersOf(const PathSequence& paths);

}  // namespace tessel::python
