#include "hosts/console/Command.hpp"

#include <fmt/format.h>
#include <unistd.h>

#include <algorithm>

#include "hosts/console/Terminal.hpp"

namespace tessel::console {

Command::Command(const Description& description)
    : line_(fmt::format("tessel {}", description.name),
            std::string(description.summary),
            std::string(description.examples)) {
    line_.flag("-q", quiet_, "Show no progress, write only results and errors");
}

ProgressBar::Visibility Command::barVisibility(const Session& session,
                                               Writes writes,
                                               Reads reads) const {
    const bool disturbs =
        (writes == Writes::Paths && isTerminal(session.output.descriptor())) ||
        (reads == Reads::Input && isTerminal(STDIN_FILENO));
    return quiet_ || disturbs ? ProgressBar::Visibility::Hidden
                              : ProgressBar::Visibility::Shown;
}

void Command::addThreads() {
    line_.number("-j", "N", threads_,
                 "Use at most N cores (default: all; the output is the same)");
}

unsigned Command::threads() const noexcept {
    // Beyond this nobody has cores.
    constexpr std::uint64_t most = 1024;
    return static_cast<unsigned>(std::min(threads_.value_or(0), most));
}

}  // namespace tessel::console
