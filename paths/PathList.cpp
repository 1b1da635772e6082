#include "paths/PathList.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <system_error>
#include <utility>

namespace tessel::paths {

namespace {

PathListError cannotRead(const std::string& name, int error) {
    return PathListError("Cannot read " + name + ": " +
                         std::generic_category().message(error) + ".");
}

class FileDescriptor {
public:
    explicit FileDescriptor(int descriptor) : number_(descriptor) {}
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;
    ~FileDescriptor() {
        if (number_ >= 0) ::close(number_);
    }
    int get() const noexcept { return number_; }

private:
    int number_;
};

// The size of what is open there, as far as that can be told; at least one
// block.
std::size_t expectedBytes(int file) noexcept {
    constexpr std::size_t block = std::size_t{1} << 16U;
    struct stat about {};
    if (::fstat(file, &about) != 0 || about.st_size <= 0) return block;
    return std::max(block, static_cast<std::size_t>(about.st_size) + 1);
}

std::string readAll(const std::string& name) {
    const FileDescriptor file(::open(name.c_str(), O_RDONLY | O_CLOEXEC));
    if (file.get() < 0) throw cannotRead(name, errno);
    std::string text(expectedBytes(file.get()), '\0');
    std::size_t filled = 0;
    for (;;) {
        if (filled == text.size()) text.resize(text.size() * 2);
        const ssize_t got =
            ::read(file.get(), text.data() + filled, text.size() - filled);
        if (got < 0 && errno != EINTR) throw cannotRead(name, errno);
        if (got == 0) break;
        if (got > 0) filled += static_cast<std::size_t>(got);
    }
    text.resize(filled);
    return text;
}

}  // namespace

void PathList::append(std::string_view path) {
    if (path.empty()) throw std::invalid_argument("A path is empty.");
    text_.append(path);
    text_.push_back('\0');
    ends_.push_back(text_.size() - 1);
}

PathList PathList::fromText(std::string text, const std::string& name) {
    const char separator = text.find('\0') == std::string::npos ? '\n' : '\0';
    if (!text.empty() && text.back() != separator) text.push_back(separator);

    PathList list;
    list.ends_.reserve(static_cast<std::size_t>(
        std::count(text.begin(), text.end(), separator)));
    for (std::size_t start = 0; start < text.size();) {
        const std::size_t end = text.find(separator, start);
        if (end == start) {
            throw PathListError(
                name + ", " + (separator == '\n' ? "line " : "entry ") +
                std::to_string(list.size() + 1) + ": an empty path.");
        }
        list.ends_.push_back(end);
        start = end + 1;
    }
    list.text_ = std::move(text);
    return list;
}

PathList readListFile(const std::string& file) {
    return PathList::fromText(readAll(file), file);
}

PathList readPaths(const std::string& fileOrFolder, WalkReport& report) {
    struct stat about {};
    if (::stat(fileOrFolder.c_str(), &about) != 0) {
        throw cannotRead(fileOrFolder, errno);
    }
    PathList list = S_ISDIR(about.st_mode) ? listFolder(fileOrFolder, report)
                                           : readListFile(fileOrFolder);
    if (list.empty()) {
        throw PathListError(fileOrFolder + " holds no paths.");
    }
    return list;
}

}  // namespace tessel::paths
