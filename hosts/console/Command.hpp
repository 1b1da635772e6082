#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "hosts/console/CommandLine.hpp"
#include "hosts/console/ExitStatus.hpp"
#include "hosts/console/ProgressBar.hpp"
#include "hosts/console/Session.hpp"

namespace tessel::console {

// A command of `tessel`, such as `tessel list`. Made, told its command line
// and run once.
class Command {
public:
    // Parts of every command's help.
    struct Description {
        std::string_view name;
        std::string_view summary;
        std::string_view examples;
    };

    Command(const Command&) = delete;
    Command& operator=(const Command&) = delete;
    virtual ~Command() = default;

    CommandLine& line() noexcept { return line_; }
    const CommandLine& line() const noexcept { return line_; }

    // Does the work. Output may be left in the session's buffers, whatever
    // ends it. Throws what Failure describes.
    virtual ExitStatus run(Session& session) = 0;

protected:
    explicit Command(const Description& description);

    // What a command writes to standard output while it works.
    enum class Writes { Nothing, Paths };

    // Whether a command is asked something through standard input.
    enum class Reads { Files, Input };

    // Shown unless -q is given, or paths go to a terminal or questions come
    // from one: between them, a bar would only disturb.
    ProgressBar::Visibility barVisibility(const Session& session, Writes writes,
                                          Reads reads = Reads::Files) const;
    bool isQuiet() const noexcept { return quiet_; }

    // -j N, for commands that use several cores.
    void addThreads();
    unsigned threads() const noexcept;

private:
    CommandLine line_;
    bool quiet_ = false;
    std::optional<std::uint64_t> threads_;
};

}  // namespace tessel::console
