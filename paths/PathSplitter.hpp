#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "paths/PathList.hpp"

namespace tessel::paths {

// Where a path is cut into root, folders and file.
struct PathSplit {
    std::size_t rootEnd = 0;    // the root is what lies before; it may be empty
    std::size_t fileStart = 0;  // the file's name is the rest from here

    bool operator==(const PathSplit&) const = default;
};

// The root of a path that is too short to have one: a path of one character
// is this root and itself as the file. No bytes have this text, so it is no
// path's beginning, and textToPath leaves it out again.
inline constexpr char16_t noRoot = 0xDC00;

// Position of the first '/' of path at or after `from` that separates two
// components, or npos. Of several in a row that is the last one, so that the
// others belong to the name before; those at the end belong to the file.
std::size_t findSeparator(std::string_view path, std::size_t from) noexcept;

// Calls visit(std::string_view) for each folder below the root, from the top.
template <class Visit>
void forEachFolder(std::string_view path, const PathSplit& split, Visit visit) {
    std::size_t start = split.rootEnd;
    while (start < split.fileStart) {
        const std::size_t end = findSeparator(path, start);
        visit(path.substr(start, end - start));
        start = end + 1;
    }
}

// PathSplitter knows where to cut each path of a list, so that
//   - the text of the root, then that of each folder and one '/', then the
//     file's, is the path again,
//   - no component is empty, except the root of a path of one character,
//   - no file of the list is at the same time a folder of another path, which
//     would make the coder lose it.
//
// Usually the root is "/" for absolute paths and the first name with its '/'
// for others, and the file is what follows the last '/'. A path that is also
// a folder of another one (`x/y/z` beside `x/y/z/a`) is cut one level higher:
// its file is `y/z`. Directly below the root, the root is made longer or
// shorter until only files can follow it. For `/a` beside `/a/b`, where no
// other cut is left, the others have the root `/a/`.
//
// Ownership: keeps a reference to the list, which must stay as it is.
// Threads: any number of readers.
// Cost: a bit a path; while it is made, 48 bytes a folder of the list.
class PathSplitter {
public:
    explicit PathSplitter(const PathList& paths);

    // The cut of path i.
    PathSplit split(std::size_t i) const;

    // True if path i is cut in another place because others lie below it.
    bool isKeptApart(std::size_t i) const { return keptApart_[i]; }
    std::size_t keptApartCount() const noexcept { return apartCount_; }

    const PathList& list() const noexcept { return *all_; }

private:
    std::size_t rootEnd(std::string_view path) const noexcept;
    PathSplit usualSplit(std::string_view path) const noexcept;

    const PathList* all_;
    std::vector<bool> keptApart_;
    std::size_t apartCount_ = 0;
    // Paths `/a` of one character below "/" that are folders, too.
    std::vector<std::string> longRoots_;
};

}  // namespace tessel::paths
