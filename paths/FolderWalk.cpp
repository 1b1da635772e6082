#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <system_error>
#include <utility>

#include "paths/PathList.hpp"

namespace tessel::paths {

namespace {

struct Entries {
    std::vector<std::string> files;
    std::vector<std::string> folders;
};

class OpenFolder {
public:
    explicit OpenFolder(DIR* stream) : folder_(stream) {}
    OpenFolder(const OpenFolder&) = delete;
    OpenFolder& operator=(const OpenFolder&) = delete;
    ~OpenFolder() {
        if (folder_ != nullptr) ::closedir(folder_);
    }
    DIR* get() const noexcept { return folder_; }

private:
    DIR* folder_;
};

DIR* openStream(const std::string& name, bool followLink) {
    const int flags =
        O_RDONLY | O_DIRECTORY | O_CLOEXEC | (followLink ? 0 : O_NOFOLLOW);
    const int file = ::open(name.c_str(), flags);
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
    const OpenFolder folder(openStream(name, followLink));
    if (folder.get() == nullptr) return errno;
    for (;;) {
        errno = 0;
        // One stream, one reader.
        const dirent* entry =
            ::readdir(folder.get());  // NOLINT(concurrency-mt-unsafe)
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

PathList listFolder(const std::string& folder, WalkReport& report) {
    PathList list;
    std::vector<std::string> waiting = {folder};
    std::string path;
    for (bool top = true; !waiting.empty(); top = false) {
        const std::string name = std::move(waiting.back());
        waiting.pop_back();
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
            list.append(path.assign(prefix).append(file));
        }
        for (auto sub = entries.folders.rbegin(); sub != entries.folders.rend();
             ++sub) {
            waiting.push_back(prefix + *sub);
        }
    }
    return list;
}

}  // namespace tessel::paths
