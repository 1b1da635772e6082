#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "paths/PathList.hpp"

namespace tessel::paths {

// Where a path is cut into root, folders and file.
struct PathSplit {
    std::size_t rootEnd = 0;    // end of the root, which may be empty
    std::size_t fileStart = 0;  // begin of the file's name

    bool operator==(const PathSplit&) const = default;
};

// The root of a path of one character, which is too short to have another one.
// No bytes have this text, so no path begins with it, and textToPath leaves it
// out.
inline constexpr char16_t noRoot = 0xDC00;

// Position of the first '/' of path at or after `from` that separates two
// components, or npos. In a run of '/' it is the last one: the others belong to
// the name before it. A run at the path's end belongs to the file's name.
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

// PathSplitter says where to cut each path of a list, for hosts that join
// components with '/' themselves, so that
//   - the text of the root, then each folder and one '/', then the file's name
//     is the path again,
//   - no component is empty, except the root of a path of one character,
//   - no file of the list is also a folder of another path: the coder would
//     lose such a file.
//
// Cuts, with '|' after the root and after each folder:
//
//   path       is cut as     because
//   /a/b/c     /|a|b|c       the root of an absolute path is its leading '/'
//   //a/b      //|a|b        all of them
//   a/b/c      a/|b|c        that of another path is its first name and '/'
//   a//b//c    a//|b/|c      all but one '/' of a run belong to the name before
//   /a/b/      /|a|b/        '/' at the end belong to the file's name
//   a/         a|/           the root must not be all of the path: it loses
//   //         /|/           its last character
//   name       n|ame         a path without '/' gives its first character
//   a          |a            one character is the file; its root is noRoot
//
// A path that other paths have as a folder is cut at another place:
//
//   path       beside        is cut as   because
//   /x/y/z     /x/y/z/a      /|x|y/z     the file takes in the folder above
//   /xyz       /xyz/a        /x|yz       below the root, the root grows
//   x/y        x/y/a         x|/y        or shrinks, if the name has one
//                                        character
//   /a         /a/b          /|a         if it cannot do either, the root of
//                                        the others grows: /a/|b
//
// Ownership: keeps a reference to the list, which must stay as it is.
// Threads: any number of readers.
// Cost: a bit per path; while it is made, 30 to 40 bytes per folder of the
// list.
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
    void keepApart(std::size_t i);
    std::size_t rootEnd(std::string_view path) const noexcept;
    PathSplit usualSplit(std::string_view path) const noexcept;

    const PathList* all_;
    std::vector<bool> keptApart_;
    std::size_t apartCount_ = 0;
    // Paths `/a` of one character below "/" that are folders, too.
    std::vector<std::string> longRoots_;
};

}  // namespace tessel::paths
