#include "archive/FileMapping.hpp"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
#include <utility>

#include "archive/ArchiveExceptions.hpp"

namespace tessel::archive {
namespace {

[[noreturn]] void fail(int error, const std::string& file) {
    throw std::system_error(error, std::generic_category(), file);
}

// A file descriptor that closes itself.
class Descriptor {
public:
    explicit Descriptor(const std::string& file)
        : number_(::open(file.c_str(), O_RDONLY | O_CLOEXEC)) {
        if (number_ < 0) fail(errno, file);
    }
    ~Descriptor() { ::close(number_); }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;

    int number() const noexcept { return number_; }

private:
    int number_;
};

// Bytes of the regular file behind the descriptor.
std::size_t sizeOf(const Descriptor& descriptor, const std::string& file) {
    struct stat status {};
    if (::fstat(descriptor.number(), &status) != 0) fail(errno, file);
    if (S_ISDIR(status.st_mode)) fail(EISDIR, file);
    if (!S_ISREG(status.st_mode)) fail(ENODEV, file);  // as mmap would say
    return static_cast<std::size_t>(status.st_size);
}

}  // namespace

// Complete before it maps anything, so that a throw unmaps it.
FileMapping::FileMapping(const std::string& file) : FileMapping() {
    const Descriptor descriptor(file);
    const std::size_t size = sizeOf(descriptor, file);
    if (size == 0) return;  // mmap refuses to map nothing
    void* const start =
        ::mmap(nullptr, size, PROT_READ, MAP_SHARED, descriptor.number(), 0);
    if (start == MAP_FAILED) fail(errno, file);
    start_ = start;
    size_ = size;
    lostPages_ = LostPages(start_, size_);
    lastBytes_ = lastBytes();
}

FileMapping::~FileMapping() {
    lostPages_ = {};
    if (start_ != nullptr) ::munmap(start_, size_);
}

void FileMapping::failChanged() const {
    throw DamagedArchiveException(
        size_,
        "The file was cut or overwritten while it was open, or the disk "
        "failed.");
}

void FileMapping::settle() {
    constexpr std::size_t smallestPage = 4096;
    const volatile std::uint8_t* const start = bytes().data();
    for (std::size_t i = 0; i < size_; i += smallestPage)
        static_cast<void>(start[i]);
    if (start_ != nullptr) lostPages_ = LostPages(start_, size_);
    lastBytes_ = lastBytes();
}

void FileMapping::releasePages() const noexcept {
    if (start_ != nullptr) ::madvise(start_, size_, MADV_DONTNEED);
}

FileMapping::FileMapping(FileMapping&& other) noexcept
    : start_(std::exchange(other.start_, nullptr)),
      size_(std::exchange(other.size_, 0)),
      lastBytes_(std::exchange(other.lastBytes_, 0)),
      lostPages_(std::move(other.lostPages_)) {}

FileMapping& FileMapping::operator=(FileMapping&& other) noexcept {
    std::swap(start_, other.start_);
    std::swap(size_, other.size_);
    std::swap(lastBytes_, other.lastBytes_);
    std::swap(lostPages_, other.lostPages_);
    return *this;
}

}  // namespace tessel::archive
