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
    // If this is a pipe, a larger buffer lets the process that reads it and
    // this one work at the same time: listing a million paths takes 60 % of
    // the time that it takes with the usual 64 KiB. The call fails, without
    // harm, if this is no pipe or the system's limit is lower.
    ::fcntl(descriptor_, F_SETPIPE_SZ, pipeCapacity);
}

void OutputBuffer::flush() {
    if (background_) {
        background_->write(buffer_);
        return background_->wait();
    }
    writeAll(buffer_);
    buffer_.clear();
}

void OutputBuffer::writeLarge(std::string_view bytes) {
    if (bytes.size() >= capacity) {
        flush();
        return writeAll(bytes);
    }
    writeBuffer();
    buffer_.append(bytes);
}

void OutputBuffer::writeBuffer() {
    if (wroteFirst_ && !background_) startBackground();
    wroteFirst_ = true;
    if (!background_) return flush();
    background_->write(buffer_);
    buffer_.reserve(capacity);
}

// Without a second core or a thread, writing goes on in the foreground.
void OutputBuffer::startBackground() {
    if (std::thread::hardware_concurrency() < 2) return;
    try {
        background_ = std::make_unique<BackgroundWriter>(
            [this](std::string_view bytes) { writeAll(bytes); });
    } catch (const std::system_error&) {
        background_ = nullptr;
    }
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
