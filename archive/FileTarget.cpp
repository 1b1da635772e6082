#include "archive/FileTarget.hpp"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <optional>
#include <random>
#include <system_error>

#include "packing/LinkTarget.hpp"
#include "packing/OpenFolder.hpp"

namespace tessel::archive {

namespace {

namespace fs = std::filesystem;

constexpr std::string_view suffix = ".tmp";
constexpr std::size_t randomLetters = 6;
// Leaves room for the rest of the name below the usual limit of 255.
constexpr std::size_t maxNameInPrefix = 200;

[[noreturn]] void fail(const std::string& file) {
    throw std::system_error(errno, std::generic_category(), file);
}

// The type and permissions of a file, if it is there.
std::optional<mode_t> modeOf(const std::string& file) {
    struct stat status {};
    if (::stat(file.c_str(), &status) == 0) return status.st_mode;
    if (errno != ENOENT) fail(file);
    return std::nullopt;
}

void requireRegular(mode_t mode, const std::string& file) {
    if (S_ISREG(mode)) return;
    if (!S_ISDIR(mode))
        throw std::system_error(EINVAL, std::generic_category(),
                                file + ": not a regular file");
    errno = EISDIR;
    fail(file);
}

// The file that is to be replaced: the target, or what it links to, which need
// not exist.
std::string replacedFile(const std::string& file) {
    std::error_code error;
    const fs::path target = linkTarget(file, error);
    if (error) throw std::system_error(error, file);
    return target.string();
}

std::string hiddenPrefix(std::string_view name) {
    std::string prefix(1, '.');
    prefix.append(name.substr(0, maxNameInPrefix));
    return prefix.append(".tessel-");
}

std::string randomName() {
    constexpr std::string_view letters = "abcdefghijklmnopqrstuvwxyz0123456789";
    std::random_device source;
    std::uniform_int_distribution<std::size_t> choose(0, letters.size() - 1);
    std::string name(randomLetters, ' ');
    for (char& letter : name) letter = letters[choose(source)];
    return name;
}

bool isHiddenName(std::string_view name, std::string_view prefix) {
    return name.size() == prefix.size() + randomLetters + suffix.size() &&
           name.starts_with(prefix) && name.ends_with(suffix);
}

// Removes a hidden file unless its writer still holds its lock.
void removeIfLeft(const std::string& path) {
    const int descriptor =
        ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NOFOLLOW);
    if (descriptor < 0) return;
    if (::flock(descriptor, LOCK_EX | LOCK_NB) == 0) ::unlink(path.c_str());
    ::close(descriptor);
}

// What killed writers of the same target left behind. Nothing here is worth
// an error: the next writer tries again.
void removeLeftovers(const std::string& folder, std::string_view prefix) {
    OpenFolder entries(::opendir(folder.c_str()));
    while (const dirent* const entry = entries.next())
        if (isHiddenName(&entry->d_name[0], prefix))
            removeIfLeft(folder + &entry->d_name[0]);
}

}  // namespace

// Complete before it makes a file, so that a throw removes it.
FileTarget::FileTarget(const std::string& file) : FileTarget() {
    const auto oldMode = modeOf(file);
    if (oldMode) requireRegular(*oldMode, file);
    file_ = replacedFile(file);
    const std::size_t nameAt = file_.rfind('/') + 1;
    folder_ = nameAt == 0 ? "./" : file_.substr(0, nameAt);
    prefix_ = hiddenPrefix(std::string_view(file_).substr(nameAt));
    removeLeftovers(folder_, prefix_);
    while (!tryCreate()) {
    }
    if (oldMode) takePermissions(*oldMode);
}

bool FileTarget::isHiddenFile(const std::string& target,
                              std::string_view path) {
    // Nearly no other path gets as far as a look at the target.
    if (!path.ends_with(suffix)) return false;
    const fs::path name = fs::path(replacedFile(target)).filename();
    return isHiddenName(path.substr(path.rfind('/') + 1),
                        hiddenPrefix(name.native()));
}

FileTarget::~FileTarget() { removeTemporary(); }

void FileTarget::removeTemporary() noexcept {
    if (descriptor_ < 0) return;
    if (!temporary_.empty()) ::unlink(temporary_.c_str());
    ::close(descriptor_);
    descriptor_ = -1;
}

// False if somebody else has the name, or took the file for a leftover before
// it was locked.
bool FileTarget::tryCreate() {
    temporary_ = folder_ + prefix_ + randomName();
    temporary_ += suffix;
    descriptor_ = ::open(temporary_.c_str(),
                         O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0666);
    if (descriptor_ < 0) {
        if (errno == EEXIST) return false;
        fail(file_);
    }
    // Where there are no locks, nobody gets one to remove this file either.
    const bool isTaken =
        ::flock(descriptor_, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
    struct stat status {};
    if (::fstat(descriptor_, &status) != 0) fail(file_);
    if (!isTaken && status.st_nlink > 0) return true;
    removeTemporary();
    return false;
}

void FileTarget::takePermissions(mode_t mode) const {
    // Some file systems know no permissions.
    if (::fchmod(descriptor_, mode & 07777U) != 0 && errno != EPERM)
        fail(file_);
}

void FileTarget::append(Bytes bytes) {
    write(bytes, size_);
    size_ += bytes.size();
}

void FileTarget::rewriteStart(Bytes bytes) { write(bytes, 0); }

void FileTarget::write(Bytes bytes, std::uint64_t offset) const {
    while (!bytes.empty()) {
        const ssize_t written =
            ::pwrite(descriptor_, bytes.data(), bytes.size(),
                     static_cast<off_t>(offset));
        if (written < 0) {
            if (errno == EINTR) continue;
            fail(file_);
        }
        bytes = bytes.subspan(static_cast<std::size_t>(written));
        offset += static_cast<std::uint64_t>(written);
    }
}

void FileTarget::commit() {
    if (::fsync(descriptor_) != 0) fail(file_);
    if (::rename(temporary_.c_str(), file_.c_str()) != 0) fail(file_);
    temporary_.clear();
    flushFolder();
}

// Some file systems cannot flush a folder; the rename is done all the same.
void FileTarget::flushFolder() const {
    const int folder =
        ::open(folder_.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (folder < 0) return;
    ::fsync(folder);
    ::close(folder);
}

}  // namespace tessel::archive
