#include "paths/WholeFile.hpp"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <optional>
#include <random>
#include <string_view>
#include <system_error>
#include <utility>

#include "packing/LinkTarget.hpp"
#include "packing/OpenFolder.hpp"

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
    FileDescriptor() = default;
    explicit FileDescriptor(int descriptor) : number_(descriptor) {}
    FileDescriptor(const FileDescriptor&) = delete;
    FileDescriptor& operator=(const FileDescriptor&) = delete;
    ~FileDescriptor() { close(); }
    int get() const noexcept { return number_; }
    // Closes it, if it is open, and returns 0 or what went wrong.
    int close() noexcept {
        const int closed = number_ < 0 ? 0 : ::close(number_);
        number_ = -1;
        return closed == 0 ? 0 : errno;
    }
    // Takes another one.
    void reset(int descriptor) noexcept {
        close();
        number_ = descriptor;
    }

private:
    int number_ = -1;
};

// The size of an open file, as far as that can be told; at least one block.
std::size_t expectedBytes(int file) noexcept {
    constexpr std::size_t block = std::size_t{1} << 16U;
    struct stat about {};
    if (::fstat(file, &about) != 0 || about.st_size <= 0) return block;
    return std::max(block, static_cast<std::size_t>(about.st_size) + 1);
}

// The type and permissions of a file, if it is there.
std::optional<mode_t> modeOf(const std::string& file) {
    struct stat about {};
    if (::stat(file.c_str(), &about) == 0) return about.st_mode;
    if (errno != ENOENT) fail("write", file, errno);
    return std::nullopt;
}

// What a link leads to that has no file there yet; the name itself if it is no
// link. Its folder's own links are followed once, here.
std::string newFile(const std::string& file) {
    std::error_code error;
    const std::filesystem::path target = linkTarget(file, error);
    if (error) fail("write", file, error.value());
    const auto folder = std::filesystem::canonical(
        target.has_parent_path() ? target.parent_path() : ".", error);
    if (error) fail("write", file, error.value());
    return (folder / target.filename()).string();
}

// The file that is to be replaced: what symbolic links lead to. An open file
// that was removed can be reached through /proc/self/fd, but has no name to
// follow: for it, the name as given, beside which no file can be made.
std::string replacedFile(const std::string& file, bool isThere) {
    std::error_code error;
    const auto target = std::filesystem::canonical(file, error);
    if (!error) return target.string();
    if (error != std::errc::no_such_file_or_directory)
        fail("write", file, error.value());
    return isThere ? file : newFile(file);
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
bool isSpecial(mode_t mode) noexcept {
    return !S_ISREG(mode) && !S_ISDIR(mode);
}

void writeInto(const std::string& file, std::span<const std::uint8_t> bytes) {
    FileDescriptor target(::open(file.c_str(), O_WRONLY | O_CLOEXEC));
    if (target.get() < 0) fail("write", file, errno);
    writeAll(target, bytes, file);
    if (const int error = target.close(); error != 0)
        fail("write", file, error);
}

// ---- Replacing ----

// What the names of the new files beside a target begin and end with. Whatever
// replaces the target uses the same names, so that each removes what another
// left when it was killed.
std::string hiddenPrefix(const std::string& target) {
    // Of a long name the beginning, so that the new one is not too long.
    constexpr std::size_t maxNameBytes = 200;
    std::string prefix(1, '.');
    prefix.append(target, target.rfind('/') + 1, maxNameBytes);
    return prefix.append(".tessel-");
}
constexpr std::string_view hiddenSuffix = ".tmp";
constexpr std::size_t randomLetters = 6;

std::string randomName() {
    constexpr std::string_view letters = "abcdefghijklmnopqrstuvwxyz0123456789";
    std::random_device source;
    std::uniform_int_distribution<std::size_t> choose(0, letters.size() - 1);
    std::string name(randomLetters, ' ');
    for (char& letter : name) letter = letters[choose(source)];
    return name;
}

// Removes a file unless its writer still holds its lock.
void removeIfLeft(const std::string& file) {
    const FileDescriptor left(
        ::open(file.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW));
    if (left.get() >= 0 && ::flock(left.get(), LOCK_EX | LOCK_NB) == 0)
        ::unlink(file.c_str());
}

// Nothing here is worth an error: the next writer tries again.
void removeLeftovers(const std::string& target) {
    const std::string prefix = hiddenPrefix(target);
    const std::string folder = folderOf(target);
    const std::size_t bytes =
        prefix.size() + randomLetters + hiddenSuffix.size();
    OpenFolder entries(::opendir(folder.c_str()));
    while (const dirent* const entry = entries.next()) {
        const std::string_view name = &entry->d_name[0];
        if (name.size() == bytes && name.starts_with(prefix) &&
            name.ends_with(hiddenSuffix))
            removeIfLeft((folder + '/').append(name));
    }
}

// A new file beside the target, which is removed unless it takes its place. It
// is locked, so that nobody takes it for one that a killed writer left.
class Replacement {
public:
    explicit Replacement(const std::string& target) : target_(target) {
        removeLeftovers(target);
        while (!tryCreate()) {
        }
    }
    Replacement(const Replacement&) = delete;
    Replacement& operator=(const Replacement&) = delete;
    ~Replacement() { remove(); }

    void takePermissions(mode_t mode) const {
        constexpr mode_t permissions = 07777;
        // Those of a file that is not ours, or has none, stay the usual ones.
        if (::fchmod(file_.get(), mode & permissions) != 0 && errno != EPERM)
            fail("write", target_, errno);
    }

    void write(std::span<const std::uint8_t> bytes) const {
        writeAll(file_, bytes, target_);
    }

    // Moves it to the target's place once its bytes are on disk. The lock is
    // kept until then.
    void commit() {
        if (::fsync(file_.get()) != 0) fail("write", target_, errno);
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
    // False if somebody else has the name, or took the file for a leftover
    // before it was locked.
    bool tryCreate() {
        constexpr mode_t usual = 0666;
        std::string name = target_.substr(0, target_.rfind('/') + 1);
        name.append(hiddenPrefix(target_)).append(randomName());
        name.append(hiddenSuffix);
        const int file = ::open(name.c_str(),
                                O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, usual);
        if (file < 0 && errno == EEXIST) return false;
        if (file < 0) fail("write", target_, errno);
        file_.reset(file);
        name_ = std::move(name);
        // Where there are no locks, nobody gets one to remove this file either.
        if (::flock(file, LOCK_EX | LOCK_NB) == 0 || errno != EWOULDBLOCK) {
            struct stat about {};
            if (::fstat(file, &about) != 0 || about.st_nlink > 0) return true;
        }
        remove();
        return false;
    }

    void remove() noexcept {
        if (!name_.empty()) ::unlink(name_.c_str());
        name_.clear();
        file_.close();
    }

    std::string target_;
    std::string name_;  // empty while there is no file, or it has the target's
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
    const auto oldMode = modeOf(file);
    if (oldMode && isSpecial(*oldMode)) return writeInto(file, bytes);
    Replacement replacement(replacedFile(file, oldMode.has_value()));
    if (oldMode) replacement.takePermissions(*oldMode);
    replacement.write(bytes);
    replacement.commit();
}

}  // namespace tessel::paths
