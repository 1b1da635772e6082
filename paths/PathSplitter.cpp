#include "paths/PathSplitter.hpp"

#include <algorithm>
#include <cstdint>
#include <functional>

#include "paths/PathText.hpp"

namespace tessel::paths {

namespace {

// A set of texts that are beginnings of a list's paths: open addressing, at
// most half full.
class FolderSet {
public:
    // Returns false if it was there before.
    bool insert(std::string_view folder) {
        if (2 * (count_ + 1) > slots_.size()) grow();
        const std::uint64_t hash = hashOf(folder);
        Slot& slot = slots_[find(folder, hash)];
        if (slot.folder.data() != nullptr) return false;
        slot = {folder, hash};
        ++count_;
        return true;
    }

    bool contains(std::string_view folder) const {
        return count_ != 0 &&
               slots_[find(folder, hashOf(folder))].folder.data() != nullptr;
    }

private:
    struct Slot {
        std::string_view folder;
        std::uint64_t hash = 0;
    };

    static std::uint64_t hashOf(std::string_view folder) noexcept {
        return std::hash<std::string_view>()(folder);
    }

    std::size_t find(std::string_view folder, std::uint64_t hash) const {
        const std::size_t mask = slots_.size() - 1;
        std::size_t at = hash & mask;
        while (slots_[at].folder.data() != nullptr &&
               (slots_[at].hash != hash || slots_[at].folder != folder)) {
            at = (at + 1) & mask;
        }
        return at;
    }

    void grow() {
        std::vector<Slot> old(std::max<std::size_t>(64, slots_.size() * 2));
        old.swap(slots_);
        const std::size_t mask = slots_.size() - 1;
        for (const Slot& slot : old) {
            if (slot.folder.data() == nullptr) continue;
            std::size_t at = slot.hash & mask;
            while (slots_[at].folder.data() != nullptr) at = (at + 1) & mask;
            slots_[at] = slot;
        }
    }

    std::vector<Slot> slots_;
    std::size_t count_ = 0;
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
    for (std::size_t i = 0; i < paths.size(); ++i) {
        if (!folders.contains(paths[i])) continue;
        // Only here is a root of one character followed by one character.
        if (splitBelowRoot(paths[i], 1).rootEnd == 0) {
            if (!std::binary_search(longRoots_.begin(), longRoots_.end(),
                                    paths[i])) {
                longRoots_.insert(std::upper_bound(longRoots_.begin(),
                                                   longRoots_.end(), paths[i]),
                                  std::string(paths[i]));
            }
            continue;
        }
        keptApart_[i] = true;
        ++apartCount_;
    }
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
        // There is no name behind the root, or no root before the name.
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
