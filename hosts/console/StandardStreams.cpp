#include "hosts/console/StandardStreams.hpp"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

namespace tessel::console {

namespace {

constexpr const char* nullDevice = "/dev/null";

bool isClosed(int descriptor) noexcept {
    return ::fcntl(descriptor, F_GETFD) < 0 && errno == EBADF;
}

}  // namespace

void takeStandardDescriptors() {
    for (const int descriptor : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        if (!isClosed(descriptor)) continue;
        const int direction = descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY;
        // All lower numbers are taken, so that it gets this one.
        if (::open(nullDevice, direction) != descriptor)
            throw std::system_error(errno, std::generic_category(), nullDevice);
    }
}

}  // namespace tessel::console
