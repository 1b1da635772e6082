#include "archive/SegmentList.hpp"

#include <algorithm>
#include <cstring>

namespace tessel::archive {

// ---- SplitPath ----

// The C library's search looks at many bytes per step, rfind at one.
SplitPath SplitPath::of(std::string_view path) noexcept {
    const void* const slash = ::memrchr(path.data(), '/', path.size());
    if (slash == nullptr) return {{}, path};
    const auto nameAt = static_cast<std::size_t>(
        static_cast<const char*>(slash) + 1 - path.data());
    return {path.substr(0, nameAt), path.substr(nameAt)};
}

// A folder that goes on where the other path has its name holds a '/' there,
// which the name does not. So one comparison of the two always decides.
std::strong_ordering SplitPath::operator<=>(
    const SplitPath& other) const noexcept {
    const std::size_t shared = std::min(folder.size(), other.folder.size());
    const auto start =
        folder.substr(0, shared) <=> other.folder.substr(0, shared);
    if (std::is_neq(start)) return start;
    if (folder.size() == other.folder.size()) return name <=> other.name;
    return folder.size() > shared ? folder.substr(shared) <=> other.name
                                  : name <=> other.folder.substr(shared);
}

// ---- SegmentList ----

// Text that a failed addition leaves behind belongs to no name.
void SegmentList::add(const SplitPath& path) {
    if (names_.size() == names_.capacity())
        names_.reserve(2 * names_.capacity() + 1);
    const auto start = static_cast<std::uint32_t>(text_.size());
    text_.insert(text_.end(), path.name.begin(), path.name.end());
    text_.push_back('\0');
    // The last step that can fail: no folder may be left without a name.
    const std::uint32_t folder = folderOf(path);
    names_.push_back(
        {start, static_cast<std::uint32_t>(path.name.size()), folder});
    textBytes_ += path.folder.size() + path.name.size();
}

std::uint32_t SegmentList::folderOf(const SplitPath& path) {
    if (names_.empty()) return folders_.numberOf(path.folder);
    const NameRef& last = names_.back();
    const SplitPath lastPath = {folders_[last.folder], name(last)};
    if (path.folder == lastPath.folder) {
        if (path.name < lastPath.name) sorted_ = false;
        return last.folder;
    }
    const bool endsOrder = sorted_ && path < lastPath;
    const std::uint32_t number = folders_.numberOf(path.folder);
    if (endsOrder) sorted_ = false;
    return number;
}

void SegmentList::clear() {
    text_.clear();
    names_.clear();
    folders_.clear();
    textBytes_ = 0;
    sorted_ = true;
}

}  // namespace tessel::archive
