#include "hosts/console/Terminal.hpp"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdlib>
#include <string_view>

namespace tessel::console {

namespace {

// The command never changes its environment, so that reading it is safe.
std::string_view variable(const char* name) noexcept {
    const char* value = std::getenv(name);  // NOLINT(concurrency-mt-unsafe)
    return value == nullptr ? std::string_view() : value;
}

}  // namespace

bool isTerminal(int descriptor) noexcept { return ::isatty(descriptor) == 1; }

bool showsColours(int descriptor) noexcept {
    return isTerminal(descriptor) && variable("NO_COLOR").empty() &&
           variable("TERM") != "dumb";
}

std::size_t columnsOf(int descriptor) noexcept {
    winsize size{};
    if (::ioctl(descriptor, TIOCGWINSZ, &size) != 0 || size.ws_col == 0)
        return 80;
    return size.ws_col;
}

}  // namespace tessel::console
