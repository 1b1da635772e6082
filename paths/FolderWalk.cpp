#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <system_error>
#include <utility>

#include "packing/OpenFolder.hpp"
#include "paths/PathList.hpp"

namespace tessel::paths {

namespace {

struct Entries {
    std::vector<std::string> files;
    std::vector<std::string> folders;
};

// Closes a descriptor at the end and leaves errno as it was.
class Descriptor {
public:
    explicit Descriptor(int descriptor) : descriptor_(descriptor) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() { replace(AT_FDCWD); }

    int get() const noexcept { return descriptor_; }

    void replace(int descriptor) noexcept {
        const int error = errno;
        if (descriptor_ >= 0) ::close(descriptor_);
        errno = error;
        descriptor_ = descriptor;
    }

private:
    int descriptor_;
};

// Opens a folder whose name may be longer than the system takes in one call:
// the folders on the way are opened one from the other.
int openFolder(std::string_view name, int flags) {
    Descriptor parent(AT_FDCWD);
    while (name.size() >= PATH_MAX) {
        const std::size_t end = name.rfind('/', PATH_MAX - 2);
        if (end == std::string_view::npos || end == 0) break;
        const std::string part(name.substr(0, end));
        parent.replace(::openat(parent.get(), part.c_str(),
                                O_PATH | O_DIRECTORY | O_CLOEXEC));
        if (parent.get() < 0) return -1;
        name.remove_prefix(
            std::min(name.find_first_not_of('/', end), name.size() - 1));
    }
    return ::openat(parent.get(), std::string(name).c_str(), flags);
}

DIR* openStream(const std::string& name, bool followLink) {
    const int flags =
        O_RDONLY | O_DIRECTORY | O_CLOEXEC | (followLink ? 0 : O_NOFOLLOW);
    const int file = openFolder(name, flags);
    if (file < 0) return nullptr;
    DIR* stream = ::fdopendir(file);
    if (stream == nullptr) {
        const int error = errno;
        ::close(file);
        errno = error;
    }
    return stream;
}

bool isFolder(DIR* parent, const dirent& entry) noexcept {
    if (entry.d_type != DT_UNKNOWN) return entry.d_type == DT_DIR;
    struct stat about {};
    return ::fstatat(::dirfd(parent), entry.d_name, &about,
                     AT_SYMLINK_NOFOLLOW) == 0 &&
           S_ISDIR(about.st_mode);
}

bool isDots(std::string_view name) noexcept {
    return name == "." || name == "..";
}

// Reads a folder's entries, sorted. Returns 0 or what went wrong.
int readFolder(const std::string& name, bool followLink, Entries& entries) {
    OpenFolder folder(openStream(name, followLink));
    if (folder.get() == nullptr) return errno;
    for (;;) {
        errno = 0;
        const dirent* const entry = folder.next();
        if (entry == nullptr) break;
        const std::string_view text = &entry->d_name[0];
        if (isDots(text)) continue;
        auto& list =
            isFolder(folder.get(), *entry) ? entries.folders : entries.files;
        list.emplace_back(text);
    }
    const int error = errno;
    std::sort(entries.files.begin(), entries.files.end());
    std::sort(entries.folders.begin(), entries.folders.end());
    return error;
}

std::string asPrefix(std::string folder) {
    if (folder.back() != '/') folder.push_back('/');
    return folder;
}

std::string reasonOf(int error) {
    return std::generic_category().message(error);
}

void noteSkipped(const std::string& folder, int error, WalkReport& report) {
    if (report.foldersSkipped++ == 0) {
        report.firstSkipped = folder;
        report.firstReason = reasonOf(error);
    }
}

}  // namespace

void walkFolder(const std::string& folder, WalkFolders folders,
                WalkReport& report,
                const std::function<void(std::string_view)>& visit) {
    std::vector<std::string> waiting = {folder};
    std::string path;
    for (bool top = true; !waiting.empty(); top = false) {
        const std::string name = std::move(waiting.back());
        waiting.pop_back();
        if (!top && folders == WalkFolders::Show) visit(name);
        Entries entries;
        const int error = readFolder(name, top, entries);
        if (error != 0 && top) {
            throw PathListError("Cannot read " + name + ": " + reasonOf(error) +
                                ".");
        }
        if (error != 0) {
            noteSkipped(name, error, report);
        } else {
            ++report.foldersRead;
        }
        const std::string prefix = asPrefix(name);
        for (const std::string& file : entries.files) {
            visit(path.assign(prefix).append(file));
        }
        for (auto sub = entries.folders.rbegin(); sub != entries.folders.rend();
             ++sub) {
            waiting.push_back(prefix + *sub);
        }
    }
}

PathList listFolder(const std::string& folder, WalkReport& report) {
    PathList list;
    walkFolder(folder, WalkFolders::Leave, report,
               [&](std::string_view path) { list.append(path); });
    return list;
}

}  // namespace tessel::paths
