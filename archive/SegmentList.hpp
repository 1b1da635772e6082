#pragma once

#include <compare>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

#include "archive/FolderTable.hpp"

namespace tessel::archive {

// A path, split after its last '/'.
struct SplitPath {
    std::string_view folder;
    std::string_view name;

    static SplitPath of(std::string_view path) noexcept;

    // Compares the whole paths by their bytes, unsigned.
    std::strong_ordering operator<=>(const SplitPath& other) const noexcept;
    bool operator==(const SplitPath& other) const noexcept = default;
};

// Where a path's name is, and its folder's number.
struct NameRef {
    std::uint32_t start;
    std::uint32_t length;  // without the zero byte that follows
    std::uint32_t folder;
};

// The paths that the next segment will hold, split and ready to be coded.
//
// Invariants: folders are numbered by first appearance; each name's bytes are
//   followed by a zero byte.
// Ownership: owns all text. Views hold until the next path.
// Threads: no locks. Reading from several threads is safe.
// Cost: the text of the names, of each folder once, and 12 bytes per path.
class SegmentList {
public:
    // The path must not be empty, hold no zero byte, and both of its parts
    // must be at most maxComponentBytes long. If it throws std::bad_alloc, the
    // list is as it was.
    void add(const SplitPath& path);

    std::size_t size() const noexcept { return names_.size(); }
    std::uint64_t textBytes() const noexcept { return textBytes_; }
    bool sorted() const noexcept { return sorted_; }

    const std::vector<NameRef>& names() const noexcept { return names_; }
    const FolderTable& folders() const noexcept { return folders_; }
    const char* text() const noexcept { return text_.data(); }
    std::string_view name(const NameRef& ref) const noexcept {
        return {text_.data() + ref.start, ref.length};
    }

    void clear();

private:
    std::uint32_t folderOf(const SplitPath& path);

    std::vector<char> text_;
    std::vector<NameRef> names_;
    FolderTable folders_;
    std::uint64_t textBytes_ = 0;
    bool sorted_ = true;
};

}  // namespace tessel::archive
