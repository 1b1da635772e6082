#pragma once

#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>

// How a path's bytes become the components that a store keeps. A path is cut
// after each run of '/': every folder keeps its own '/', and what is left is
// the file's name. To join is to concatenate.
//
//   path      folders        file
//   /a/b      "/" "a/"       "b"
//   a//b      "a//"          "b"
//   a/        "a/"           noName
//   name      noName         "name"
//   /         "/"            noName
//
// A folder's segment ends in '/' and a file's does not, so a file is never
// taken for a folder of the same name, whatever is added later.
namespace tessel::paths {

// The segment in place of a name that is not there. No bytes have this text.
inline constexpr char16_t noName = 0xDC00;

// Where the file's name begins: after the last '/'.
inline std::size_t fileStartOf(std::string_view path) noexcept {
    if (path.empty()) return 0;  // perhaps of no bytes at all
    const void* const slash = memrchr(path.data(), '/', path.size());
    if (slash == nullptr) return 0;
    return static_cast<std::size_t>(static_cast<const char*>(slash) -
                                    path.data()) +
           1;
}

// True if these are the path's folders: its beginning up to fileStartOf. For
// the folders of the path before it, this is faster than to compare them.
inline bool hasFolders(std::string_view path,
                       std::string_view folders) noexcept {
    return path.starts_with(folders) &&
           path.find('/', folders.size()) == std::string_view::npos;
}

// Calls visit(std::string_view) with each folder's segment. `folders` is a
// path's beginning up to fileStartOf.
template <class Visit>
void forEachSegment(std::string_view folders, Visit visit) {
    while (!folders.empty()) {
        // `folders` ends in '/', so there is one.
        std::size_t end = folders.find('/') + 1;
        while (end < folders.size() && folders[end] == '/') ++end;
        visit(folders.substr(0, end));
        folders.remove_prefix(end);
    }
}

// Appends the bytes of a segment's text and returns true. Returns false, with
// `bytes` unchanged, if no segment has this text.
bool appendSegment(std::u16string_view text, std::string& bytes);

}  // namespace tessel::paths
