#include "hosts/console/NumberCommand.hpp"

#include <fmt/format.h>

#include <algorithm>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/RecordReader.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description numberDescription = {
    "number", "Write the number of each path, or ? if it is not there",
    "  tessel number files.tessel usr/bin/env\n"
    "  tessel number files.tessel - < some-paths.txt\n"
    "  find . -print0 | tessel number files.tessel -0 -"};

}  // namespace

NumberCommand::NumberCommand() : Command(numberDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().arguments("PATH", paths_, CommandLine::Need::Required,
                     "Paths; - reads one per line from standard input. Of a "
                     "path that is there more than once, the first number is "
                     "written");
    line().flag("-0", nul_,
                "Paths from standard input end with NUL instead of newline");
}

ExitStatus NumberCommand::run(Session& session) {
    const bool readsPaths = std::ranges::count(paths_, "-") > 0;
    if (file_ == "-" && readsPaths)
        line().fail("standard input cannot be both the archive and paths");
    const PathArchive archive = openArchive(file_, session.interrupts);
    ProgressBar bar(barVisibility(session, Writes::Paths,
                                  readsPaths ? Reads::Input : Reads::Files));
    bar.begin("looking up", ProgressUnit::Paths, 0);
    inFile(file_, [&] {
        for (const std::string& path : paths_)
            if (path == "-")
                answerInput(session, archive, bar);
            else
                answer(session, archive, path);
    });
    return foundAll_ ? ExitStatus::Success : ExitStatus::NoMatch;
}

void NumberCommand::answer(Session& session, const PathArchive& archive,
                           std::string_view path) {
    const auto number = archive.numberOf(path);
    if (number) {
        const fmt::format_int digits(*number);
        session.output.write({digits.data(), digits.size()});
    } else {
        session.output.put('?');
        foundAll_ = false;
    }
    session.output.put('\n');
}

void NumberCommand::answerInput(Session& session, const PathArchive& archive,
                                ProgressBar& bar) {
    InputFile input("-", session.interrupts);
    RecordReader records(input, nul_ ? Separator::Nul : Separator::Newline);
    for (;;) {
        // Whoever asks and waits for the answer gets it now.
        if (!records.hasNext()) session.output.flush();
        const auto path = records.next();
        if (!path) return;
        answer(session, archive, *path);
        bar.update(records.line());
    }
}

}  // namespace tessel::console
