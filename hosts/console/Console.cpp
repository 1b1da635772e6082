#include "hosts/console/Console.hpp"

#include <fmt/format.h>

#include <exception>

#include "archive/ArchiveExceptions.hpp"
#include "hosts/console/Commands.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Failure.hpp"
#include "qztessel/Version.hpp"

namespace tessel::console {

namespace {

constexpr const char* seeHelp = "see `tessel --help`";

ExitStatus runCommand(std::span<const std::string> words, Session& session) {
    const auto command = makeCommand(words.front());
    if (command == nullptr)
        throw ConsoleException(
            ExitStatus::Usage,
            fmt::format("'{}' is no command; {}", words.front(), seeHelp));
    if (command->line().parse(words.subspan(1)) == CommandLine::Request::Run)
        return command->run(session);
    session.output.write(command->line().help());
    return ExitStatus::Success;
}

ExitStatus run(std::span<const std::string> words, Session& session) {
    if (words.empty())
        throw ConsoleException(ExitStatus::Usage,
                               fmt::format("no command given; {}", seeHelp));
    if (words.front() == "--help") {
        session.output.write(generalHelp());
        return ExitStatus::Success;
    }
    if (words.front() == "--version") {
        session.output.write(fmt::format("tessel {}\n", versionText));
        return ExitStatus::Success;
    }
    return runCommand(words, session);
}

// What was written before a failure is shown before its line.
void flushNevertheless(OutputBuffer& output) {
    try {
        output.flush();
    } catch (const std::exception&) {
        // The first failure is the one to tell.
    }
}

}  // namespace

int runConsole(std::span<const std::string> words, Session& session) {
    try {
        const ExitStatus status = run(words, session);
        session.output.flush();
        session.errors.flush();
        return static_cast<int>(status);
    } catch (const ClosedPipeException&) {
        throw;
    } catch (const CancelledException&) {
        return session.interrupts.status();
    } catch (const std::exception&) {
        const Failure failure = describeCurrentException();
        flushNevertheless(session.output);
        session.errors.write("tessel: " + failure.line + "\n");
        flushNevertheless(session.errors);
        return static_cast<int>(failure.status);
    }
}

}  // namespace tessel::console
