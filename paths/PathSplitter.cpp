#include "paths/PathSplitter.hpp"

#include <algorithm>
#include <cstdint>

#include "paths/PathHash.hpp"
#include "paths/PathText.hpp"
#include "pathtree/HashIndex.hpp"

namespace tessel::paths {

namespace {

// A set of texts, which must stay where they are.
class FolderSet {
public:
    // Returns false if it was there before.
    bool insert(std::string_view folder) {
        const std::uint32_t hash = PathHash()(folder);
        if (find(folder, hash) != HashIndex::notFound) return false;
        folders_.push_back(folder);
        index_.insert(hash, folders_.size() - 1);
        return true;
    }

    bool contains(std::string_view folder) const {
        return find(folder, PathHash()(folder)) != HashIndex::notFound;
    }

private:
    std::size_t find(std::string_view folder, std::uint32_t hash) const {
        return index_.find(
            hash, [&](std::size_t i) { return folders_[i] == folder; });
    }

    std::vector<std::string_view> folders_;
    HashIndex index_;
};

std::size_t firstNameEnd(std::string_view path, std::size_t from) noexcept {
    return std::min(path.find('/', from), path.size());
}

std::size_t slashesEnd(std::string_view path, std::size_t from) noexcept {
    return std::min(path.find_first_not_of('/', from), path.size());
}

// Where the last character begins.
std::size_t lastCharacter(std::string_view path) noexcept {
    std::size_t at = 0;
    for (;;) {
        const std::size_t next =
            at + decodeCharacter(path.substr(at)).byteCount;
        if (next == path.size()) return at;
        at = next;
    }
}

// Position of the last '/' before `end` that separates two components, at or
// after `from`; npos if there is none.
std::size_t findLastSeparator(std::string_view path, std::size_t from,
                              std::size_t end) noexcept {
    while (end > from + 1) {
        const std::size_t at = path.rfind('/', end - 1);
        if (at == std::string_view::npos || at < from) break;
        if (at + 1 < path.size() && path[at + 1] != '/') return at;
        end = at;
    }
    return std::string_view::npos;
}

// Remembers each folder of the path, from the lowest up to the first that is
// known: the folders above that one are known, too.
void insertFolders(std::string_view path, const PathSplit& split,
                   FolderSet& folders) {
    std::size_t end = split.fileStart;
    while (end > split.rootEnd) {
        if (!folders.insert(path.substr(0, end - 1))) return;
        const std::size_t above =
            findLastSeparator(path, split.rootEnd, end - 1);
        if (above == std::string_view::npos) return;
        end = above + 1;
    }
}

// The cut of a path directly below its root which other paths have as a
// folder. The new root is followed by files only, or its other folders cannot
// have the file's name: folders begin with another character than '/'.
PathSplit splitBelowRoot(std::string_view path, std::size_t rootEnd) noexcept {
    const std::size_t longer =
        rootEnd + decodeCharacter(path.substr(rootEnd)).byteCount;
    if (longer < path.size()) return {longer, longer};
    return {rootEnd - 1, rootEnd - 1};
}

}  // namespace

std::size_t findSeparator(std::string_view path, std::size_t from) noexcept {
    std::size_t at = path.find('/', from);
    while (at != std::string_view::npos) {
        if (at + 1 == path.size()) return std::string_view::npos;
        if (path[at + 1] != '/') return at;
        ++at;
    }
    return at;
}

PathSplitter::PathSplitter(const PathList& paths)
    : all_(&paths), keptApart_(paths.size(), false) {
    FolderSet folders;
    std::string_view lastFolder;
    for (std::size_t i = 0; i < paths.size(); ++i) {
        const PathSplit split = usualSplit(paths[i]);
        const std::string_view folder = paths[i].substr(0, split.fileStart);
        if (folder == lastFolder) continue;
        insertFolders(paths[i], split, folders);
        lastFolder = folder;
    }
    for (std::size_t i = 0; i < paths.size(); ++i)
        if (folders.contains(paths[i])) keepApart(i);
}

// Path i is also a folder.
void PathSplitter::keepApart(std::size_t i) {
    const std::string_view path = (*all_)[i];
    // Only a root of one character followed by one character has no other cut.
    if (splitBelowRoot(path, 1).rootEnd == 0) {
        const auto at =
            std::lower_bound(longRoots_.begin(), longRoots_.end(), path);
        if (at == longRoots_.end() || *at != path)
            longRoots_.insert(at, std::string(path));
        return;
    }
    keptApart_[i] = true;
    ++apartCount_;
}

// The usual root, and for what lies below a path of longRoots that one and its
// '/'.
std::size_t PathSplitter::rootEnd(std::string_view path) const noexcept {
    if (path.front() != '/') return slashesEnd(path, firstNameEnd(path, 0));
    const std::size_t usual = slashesEnd(path, 0);
    if (longRoots_.empty() || usual != 1) return usual;
    const std::size_t separator = firstNameEnd(path, 1);
    if (findSeparator(path, separator) != separator ||
        !std::binary_search(longRoots_.begin(), longRoots_.end(),
                            path.substr(0, separator))) {
        return usual;
    }
    return separator + 1;
}

PathSplit PathSplitter::usualSplit(std::string_view path) const noexcept {
    const std::size_t root = rootEnd(path);
    if (root == path.size()) {
        // There is no name after the root, or no root before the name.
        const bool bareName = path.find('/') == std::string_view::npos;
        const std::size_t first = decodeCharacter(path).byteCount;
        const std::size_t cut = first == path.size() ? 0
                                : bareName           ? first
                                                     : lastCharacter(path);
        return {cut, cut};
    }
    const std::size_t separator = findLastSeparator(path, root, path.size());
    return {root, separator == std::string_view::npos ? root : separator + 1};
}

PathSplit PathSplitter::split(std::size_t i) const {
    const std::string_view path = (*all_)[i];
    PathSplit usual = usualSplit(path);
    if (!keptApart_[i]) return usual;
    if (usual.fileStart == usual.rootEnd) {
        return splitBelowRoot(path, usual.rootEnd);
    }
    const std::size_t separator =
        findLastSeparator(path, usual.rootEnd, usual.fileStart - 1);
    usual.fileStart =
        separator == std::string_view::npos ? usual.rootEnd : separator + 1;
    return usual;
}

}  // namespace tessel::paths
