#include "hosts/console/InfoCommand.hpp"

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/ArchiveReport.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/OutputFile.hpp"
#include "hosts/console/ReportPicture.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description infoDescription = {
    "info", "Tell what is in an archive and what takes how many bytes",
    "  tessel info files.tessel\n"
    "  tessel info files.tessel --json | jq .bytesPerPath\n"
    "  tessel info files.tessel --plot files.svg"};

}  // namespace

InfoCommand::InfoCommand() : Command(infoDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().flag("--json", json_, "Write JSON instead of a table");
    line().value("--plot", "OUT.svg", plot_,
                 "Draw how the file's bytes divide, and the lengths of paths; "
                 "an existing OUT.svg is replaced");
}

ExitStatus InfoCommand::run(Session& session) {
    const PathArchive archive = openArchive(file_, session.interrupts);
    ArchiveReport report;
    {
        ProgressBar bar(barVisibility(session, Writes::Nothing));
        report = inFile(file_, [&] { return reportOn(archive, file_, bar); });
    }
    if (plot_) replaceFile(*plot_, pictureOf(report), session);
    session.output.write(json_ ? jsonOf(report) : tableOf(report));
    return ExitStatus::Success;
}

}  // namespace tessel::console
