#include "hosts/console/InputFile.hpp"

#include <fcntl.h>
#include <poll.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <system_error>

namespace tessel::console {

InputFile::InputFile(const std::string& file, const Interrupts& interrupts)
    : interrupts_(&interrupts),
      name_(file == "-" ? "standard input" : file),
      descriptor_(file == "-" ? STDIN_FILENO
                              : ::open(file.c_str(), O_RDONLY | O_CLOEXEC)) {
    if (descriptor_ < 0) fail();
    struct stat about {};
    if (::fstat(descriptor_, &about) != 0 || !S_ISREG(about.st_mode)) return;
    regular_ = true;
    size_ = static_cast<std::uint64_t>(about.st_size);
}

InputFile::~InputFile() {
    if (descriptor_ > STDIN_FILENO) ::close(descriptor_);
}

std::size_t InputFile::read(char* into, std::size_t mostBytes) {
    for (;;) {
        if (!regular_) waitForInput();
        const ssize_t got = ::read(descriptor_, into, mostBytes);
        if (got >= 0) return static_cast<std::size_t>(got);
        if (errno != EINTR && errno != EAGAIN) fail();
    }
}

std::vector<std::uint8_t> InputFile::readAll() {
    constexpr std::size_t step = std::size_t{1} << 20;
    std::vector<std::uint8_t> bytes;
    for (;;) {
        const std::size_t size = bytes.size();
        bytes.resize(size + step);
        const std::size_t got =
            read(reinterpret_cast<char*>(bytes.data()) + size, step);
        bytes.resize(size + got);
        if (got == 0) return bytes;
    }
}

void InputFile::waitForInput() const {
    std::array<pollfd, 2> waits = {
        {{descriptor_, POLLIN, 0}, {interrupts_->wakeDescriptor(), POLLIN, 0}}};
    while (::poll(waits.data(), waits.size(), -1) < 0)
        if (errno != EINTR) fail();
    interrupts_->throwIfStopped();
}

void InputFile::fail() const {
    throw std::system_error(errno, std::generic_category(), name_);
}

}  // namespace tessel::console
