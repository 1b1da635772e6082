#include "archive/FileMapping.hpp"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
#include <utility>

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

FileMapping::FileMapping(const std::string& file) {
    const Descriptor descriptor(file);
    size_ = sizeOf(descriptor, file);
    if (size_ == 0) return;  // mmap refuses to map nothing
    void* const start =
        ::mmap(nullptr, size_, PROT_READ, MAP_SHARED, descriptor.number(), 0);
    if (start == MAP_FAILED) fail(errno, file);
    start_ = start;
}

FileMapping::~FileMapping() {
    if (start_ != nullptr) ::munmap(start_, size_);
}

void FileMapping::releasePages() const noexcept {
    if (start_ != nullptr) ::madvise(start_, size_, MADV_DONTNEED);
}

FileMapping::FileMapping(FileMapping&& other) noexcept
    : start_(std::exchange(other.start_, nullptr)),
      size_(std::exchange(other.size_, 0)) {}

FileMapping& FileMapping::operator=(FileMapping&& other) noexcept {
    std::swap(start_, other.start_);
    std::swap(size_, other.size_);
    return *this;
}

}  // namespace tessel::archive
