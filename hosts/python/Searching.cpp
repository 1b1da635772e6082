#include "hosts/python/Searching.hpp"

#include <algorithm>
#include <functional>
#include <iterator>
#include <stop_token>
#include <unordered_map>
#include <unordered_set>
#include <utility>

#include "archive/NumberLookup.hpp"
#include "hosts/python/Chunks.hpp"
#include "hosts/python/Errors.hpp"
#include "hosts/python/Interruptible.hpp"
#include "paths/PathHash.hpp"

namespace tessel::python {

namespace {

using Indices = std::vector<std::uint64_t>;

// Shows all paths to consume(chunk, produce(chunk)); see inChunks.
template <class Result, class Produce, class Consume>
void scanAll(const PathSequence& paths, Produce produce, Consume consume) {
    inChunks<Result>(paths.size(), pathsPerChunk(paths.size()), produce,
                     consume);
    paths.endReading(paths.size());
}

// ---- Queries ----

// Leaves the folder aside.
bool matches(const Query& query, std::string_view path) {
    const auto holds = [&](const std::string& text) {
        return path.find(text) != std::string_view::npos;
    };
    return std::ranges::all_of(query.texts, holds) &&
           (!query.matcher || query.matcher->matches(path));
}

Indices findByScan(const PathSequence& paths, const Query& query) {
    Indices found;
    const std::string prefix = archive::prefixOf(query.folder.value_or(""));
    const auto search = [&](NumberRange chunk) {
        Indices here;
        std::uint64_t index = chunk.begin;
        paths.read(chunk.begin, chunk.end, [&](std::string_view path) {
            if (path.starts_with(prefix) && matches(query, path))
                here.push_back(index);
            ++index;
        });
        return here;
    };
    scanAll<Indices>(paths, search, [&](NumberRange, const Indices& here) {
        found.insert(found.end(), here.begin(), here.end());
    });
    return found;
}

Indices findInArchive(const PathArchive& archive, const Query& query,
                      std::stop_token cancel) {
    FindOptions options;
    options.folder = query.folder;
    options.cancel = std::move(cancel);
    if (query.matcher)
        return archive.find(
            [&](std::string_view path) { return matches(query, path); },
            options);
    const std::vector<std::string_view> texts(query.texts.begin(),
                                              query.texts.end());
    return archive.find(texts, options);
}

// ---- First indices ----

// Whether each path is found in microseconds, or by a scan of its own.
bool isQuickToAsk(const PathSequence& paths) {
    const ArchiveInfo info = paths.archive().info();
    return info.sortedSegments == info.segments || paths.stored()->hasIndex();
}

// Measured on a list of 7 million paths: a scan takes 0.6 microseconds per path
// of the list, nearly all for looking the path up among a million asked for; a
// question takes 4 microseconds, or 2 nanoseconds per path of the list where it
// is a scan of its own. In a view, it searches a folder: milliseconds.
bool areWorthAScan(const PathSequence& paths, std::uint64_t asked) {
    if (!paths.view().isWhole()) return asked > 16;
    return isQuickToAsk(paths) ? asked > paths.size() / 4 : asked > 300;
}

std::int64_t firstIndexOf(const PathSequence& paths, std::string_view path) {
    if (paths.view().isWhole()) {
        const auto number = paths.archive().numberOf(path);
        return number ? static_cast<std::int64_t>(*number) : -1;
    }
    const Indices all = paths.indicesOf(path);
    return all.empty() ? -1 : static_cast<std::int64_t>(all.front());
}

using FirstIndices = std::vector<std::int64_t>;

FirstIndices askEach(const PathSequence& paths, const paths::PathList& asked) {
    // Few, because one may take milliseconds in a list that is not sorted.
    constexpr std::uint64_t perChunk = 16;
    FirstIndices indices;
    indices.reserve(asked.size());
    const auto ask = [&](NumberRange chunk) {
        FirstIndices here;
        for (std::uint64_t i = chunk.begin; i < chunk.end; ++i)
            here.push_back(firstIndexOf(paths, asked[i]));
        return here;
    };
    inChunks<FirstIndices>(asked.size(), perChunk, ask,
                           [&](NumberRange, const FirstIndices& here) {
                               indices.insert(indices.end(), here.begin(),
                                              here.end());
                           });
    return indices;
}

using IndexByPath =
    std::unordered_map<std::string_view, std::int64_t, paths::PathHash>;

// Visits all paths, unless Python's signals end that by an exception.
template <class Visit>
void forEachInterruptibly(const paths::PathList& texts, Visit visit) {
    std::stop_source stop;
    const auto visitAll = [&] {
        for (std::size_t i = 0; i < texts.size() && !stop.stop_requested(); ++i)
            visit(texts[i]);
    };
    runInterruptibly(stop, visitAll, [] {});
}

// Sets the first index of all paths that are keys, which have -1.
void scanFor(const PathSequence& paths, IndexByPath& wanted) {
    using Hits = std::vector<std::pair<std::int64_t*, std::uint64_t>>;
    const auto search = [&](NumberRange chunk) {
        Hits hits;
        std::uint64_t index = chunk.begin;
        paths.read(chunk.begin, chunk.end, [&](std::string_view path) {
            const auto found = wanted.find(path);
            if (found != wanted.end()) hits.emplace_back(&found->second, index);
            ++index;
        });
        return hits;
    };
    scanAll<Hits>(paths, search, [](NumberRange, const Hits& hits) {
        for (const auto& [first, index] : hits)
            if (*first < 0) *first = static_cast<std::int64_t>(index);
    });
}

FirstIndices askAll(const PathSequence& paths, const paths::PathList& asked) {
    IndexByPath wanted;
    forEachInterruptibly(
        asked, [&](std::string_view path) { wanted.emplace(path, -1); });
    scanFor(paths, wanted);
    FirstIndices indices;
    indices.reserve(asked.size());
    forEachInterruptibly(asked, [&](std::string_view path) {
        indices.push_back(wanted.at(path));
    });
    return indices;
}

// ---- Folders ----

std::string_view nameOfFolder(std::string_view path) {
    const std::size_t slash = path.rfind('/');
    if (slash == std::string_view::npos) return {};
    return path.substr(0, std::max<std::size_t>(slash, 1));
}

using Folders =
    std::unordered_set<std::string, paths::PathHash, std::equal_to<>>;

Folders foldersIn(const PathSequence& paths, NumberRange chunk) {
    Folders folders;
    const std::string* last = nullptr;  // neighbours mostly share a folder
    paths.read(chunk.begin, chunk.end, [&](std::string_view path) {
        const std::string_view folder = nameOfFolder(path);
        if (last == nullptr || *last != folder)
            last = &*folders.emplace(folder).first;
    });
    return folders;
}

}  // namespace

Indices findPaths(const PathSequence& paths, const Query& query) {
    if (paths.size() < paths.archive().size() / 4)
        return findByScan(paths, query);
    Indices found;
    std::stop_source stop;
    const auto search = [&] {
        found = paths.view().indicesOf(
            findInArchive(paths.archive(), query, stop.get_token()),
            stop.get_token());
    };
    runInterruptibly(
        stop, [&] { namingArchive(paths.stored()->file(), search); }, [] {});
    paths.endReading(paths.archive().size());
    return found;
}

FirstIndices firstIndicesOf(const PathSequence& paths,
                            const paths::PathList& asked) {
    return namingArchive(paths.stored()->file(), [&] {
        return areWorthAScan(paths, asked.size()) ? askAll(paths, asked)
                                                  : askEach(paths, asked);
    });
}

std::vector<std::string> foldersOf(const PathSequence& paths) {
    Folders folders;
    scanAll<Folders>(
        paths, [&](NumberRange chunk) { return foldersIn(paths, chunk); },
        [&](NumberRange, Folders here) { folders.merge(here); });
    std::vector<std::string> sorted(folders.begin(), folders.end());
    std::ranges::sort(sorted);
    return sorted;
}

}  // namespace tessel::python
