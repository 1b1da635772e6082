#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace tessel::paths {

// A list of paths could not be read. what() says which and why, in a sentence
// for the user.
class PathListError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// PathList keeps the bytes of paths, in order, for any number of them.
//
// Invariants: no path is empty; the views it hands out are valid until the
//   next append.
// Threads: any number of readers.
// Cost: the text, one byte and eight more a path.
class PathList {
public:
    std::size_t size() const noexcept { return ends_.size(); }
    bool empty() const noexcept { return ends_.empty(); }

    // Path i, counted from 0; i must be below size().
    std::string_view operator[](std::size_t i) const noexcept {
        const std::size_t start = i == 0 ? 0 : ends_[i - 1] + 1;
        return {text_.data() + start, ends_[i] - start};
    }

    // Bytes of all paths, nothing between them counted.
    std::size_t textBytes() const noexcept { return text_.size() - size(); }

    // Throws std::invalid_argument if the path is empty.
    void append(std::string_view path);
    // Forgets all paths and keeps the memory for others.
    void clear() noexcept {
        text_.clear();
        ends_.clear();
    }

    // Takes over a text that holds one path after the other. They are
    // separated by NUL if the text has a NUL, otherwise by newline; a
    // separator at the end is no beginning of another path. Throws
    // PathListError if a path is empty: the message begins with `name`, the
    // text's origin, and tells the line.
    static PathList fromText(std::string text, const std::string& name);

private:
    std::string text_;                 // each path and one byte after it
    std::vector<std::uint64_t> ends_;  // where that byte is
};

// What a walk left out.
struct WalkReport {
    std::size_t foldersRead = 0;
    std::size_t foldersSkipped = 0;  // could not be opened or read
    std::string firstSkipped;
    std::string firstReason;
};

// Reads a list from a file, as PathList::fromText takes it. Also reads from a
// pipe. Throws PathListError.
PathList readListFile(const std::string& file);

// Whether a walk shows folders, too.
enum class WalkFolders { Leave, Show };

// Shows everything below a folder to visit(path): the given name, one '/' and
// the way down. Symbolic links are shown and not followed, save the given name
// itself. A folder's own files come first, in the order of their bytes, then
// each folder in it, in the same order, directly followed by what is in it.
// The given folder itself is not shown. Folders that cannot be read are
// counted; what is in them is left out. Throws PathListError if the given one
// cannot be read, and what `visit` throws.
//
// Cost: open files and stack do not grow with the depth, and paths may be
// longer than the system takes in one call.
void walkFolder(const std::string& folder, WalkFolders folders,
                WalkReport& report,
                const std::function<void(std::string_view)>& visit);

// What walkFolder shows without folders, as a list.
PathList listFolder(const std::string& folder, WalkReport& report);

// Whichever of the two the name calls for. Throws PathListError, also if
// there is no such file and if the list is empty.
PathList readPaths(const std::string& fileOrFolder, WalkReport& report);

}  // namespace tessel::paths
