#include "paths/WholeFile.hpp"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <random>
#include <system_error>

namespace tessel::paths {

namespace {

[[noreturn]] void fail(const char* verb, const std::string& file, int error) {
    throw std::system_error(error, std::generic_category(),
                            std::string("Cannot ") + verb + " " + file);
}

// The system would take what is before a NUL for the name.
void requireNoNul(const char* verb, const std::string& file) {
    if (file.find('\0') != std::string::npos) fail(verb, file, EINVAL);
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
    // Closes it and returns 0 or what went wrong.
    int close() noexcept {
        const int closed = ::close(number_);
        number_ = -1;
        return closed == 0 ? 0 : errno;
    }

private:
    int number_;
};

// The size of an open file, as far as that can be told; at least one block.
std::size_t expectedBytes(int file) noexcept {
    constexpr std::size_t block = std::size_t{1} << 16U;
    struct stat about {};
    if (::fstat(file, &about) != 0 || about.st_size <= 0) return block;
    return std::max(block, static_cast<std::size_t>(about.st_size) + 1);
}

// The file that symbolic links lead to, or the name itself if there is none.
std::string linkTarget(const std::string& file) {
    std::error_code error;
    const auto target = std::filesystem::canonical(file, error);
    return error ? file : target.string();
}

std::string folderOf(const std::string& file) {
    const std::size_t slash = file.rfind('/');
    if (slash == std::string::npos) return ".";
    return file.substr(0, slash == 0 ? 1 : slash);
}

void writeAll(const FileDescriptor& to, std::span<const std::uint8_t> bytes,
              const std::string& file) {
    while (!bytes.empty()) {
        const ssize_t written = ::write(to.get(), bytes.data(), bytes.size());
        if (written < 0 && errno != EINTR) fail("write", file, errno);
        if (written > 0)
            bytes = bytes.subspan(static_cast<std::size_t>(written));
    }
}

// True for a pipe or a device: it must not make room for a file.
bool isSpecial(const std::string& file) noexcept {
    struct stat about {};
    return ::stat(file.c_str(), &about) == 0 && !S_ISREG(about.st_mode) &&
           !S_ISDIR(about.st_mode);
}

void writeInto(const std::string& file, std::span<const std::uint8_t> bytes) {
    FileDescriptor target(::open(file.c_str(), O_WRONLY | O_CLOEXEC));
    if (target.get() < 0) fail("write", file, errno);
    writeAll(target, bytes, file);
    if (const int error = target.close(); error != 0)
        fail("write", file, error);
}

// A new file beside the target, which is removed unless it takes its place.
class Replacement {
public:
    explicit Replacement(const std::string& target)
        : target_(target), name_(unusedName(target)), file_(create()) {}
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;
    ~Replacement() {
        if (!name_.empty()) ::unlink(name_.c_str());
    }

    void write(std::span<const std::uint8_t> bytes) const {
        writeAll(file_, bytes, target_);
    }

    // Moves it to the target's place once its bytes are on disk.
    void commit() {
        if (::fsync(file_.get()) != 0) fail("write", target_, errno);
        if (const int error = file_.close(); error != 0)
            fail("write", target_, error);
        if (std::rename(name_.c_str(), target_.c_str()) != 0)
            fail("replace", target_, errno);
        name_.clear();
        // The new file is there; only a power failure could still undo it, so
        // a folder that cannot be flushed is no failure.
        const FileDescriptor folder(::open(folderOf(target_).c_str(),
                                           O_RDONLY | O_DIRECTORY | O_CLOEXEC));
        if (folder.get() >= 0) ::fsync(folder.get());
    }

private:
    static std::string unusedName(const std::string& target) {
        // Of a long name the beginning, so that the new one is not too long.
        constexpr std::size_t maxNameBytes = 200;
        std::random_device random;
        const std::size_t slash = target.rfind('/') + 1;
        return target.substr(0, slash) + "." +
               target.substr(slash, maxNameBytes) + "-" +
               std::to_string(::getpid()) + "-" + std::to_string(random()) +
               ".tmp";
    }

    int create() const {
        constexpr mode_t usual = 0666;
        const int file = ::open(name_.c_str(),
                                O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, usual);
        if (file < 0) fail("write", target_, errno);
        struct stat about {};
        constexpr mode_t permissions = 07777;
        // A target that is not there, or not ours, leaves the usual ones.
        if (::stat(target_.c_str(), &about) == 0 &&
            ::fchmod(file, about.st_mode & permissions) != 0 && errno != EPERM)
            removeAndFail(file);
        return file;
    }

    [[noreturn]] void removeAndFail(int file) const {
        const int error = errno;
        ::close(file);
        ::unlink(name_.c_str());
        fail("write", target_, error);
    }

    std::string target_;
    std::string name_;  // empty once it has the target's
    FileDescriptor file_;
};

}  // namespace

std::string readWholeFile(const std::string& file) {
    requireNoNul("read", file);
    const FileDescriptor source(::open(file.c_str(), O_RDONLY | O_CLOEXEC));
    if (source.get() < 0) fail("read", file, errno);
    std::string text(expectedBytes(source.get()), '\0');
    std::size_t filled = 0;
    for (;;) {
        if (filled == text.size()) text.resize(text.size() * 2);
        const ssize_t got =
            ::read(source.get(), text.data() + filled, text.size() - filled);
        if (got < 0 && errno != EINTR) fail("read", file, errno);
        if (got == 0) break;
        if (got > 0) filled += static_cast<std::size_t>(got);
    }
    text.resize(filled);
    return text;
}

void replaceFile(const std::string& file, std::span<const std::uint8_t> bytes) {
    requireNoNul("write", file);
    if (isSpecial(file)) return writeInto(file, bytes);
    Replacement replacement(linkTarget(file));
    replacement.write(bytes);
    replacement.commit();
}

}  // namespace tessel::paths
