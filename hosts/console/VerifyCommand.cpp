#include "hosts/console/VerifyCommand.hpp"

#include <fmt/format.h>

#include <algorithm>

#include "archive/PathArchive.hpp"
#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Failure.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description verifyDescription = {
    "verify", "Read archives completely and tell what is damaged",
    "  tessel verify files.tessel\n"
    "  tessel verify -q *.tessel && echo all are intact"};

std::string textOf(const ArchiveDamage& damage) {
    return fmt::format(
        "bytes {} to {}: {}", damage.offset,
        damage.offset + std::max<std::uint64_t>(damage.size, 1) - 1,
        damage.what);
}

}  // namespace

VerifyCommand::VerifyCommand() : Command(verifyDescription) {
    line().arguments("FILE", files_, CommandLine::Need::Required,
                     "Archives, or - for standard input");
    addThreads();
}

ExitStatus VerifyCommand::run(Session& session) {
    auto worst = ExitStatus::Success;
    for (const std::string& file : files_) {
        try {
            verify(session, file);
        } catch (const ClosedPipeException&) {
            throw;
        } catch (const std::exception&) {
            // The other files are looked at nevertheless.
            const Failure failure = describeCurrentException();
            session.output.flush();
            session.errors.write("tessel: " + failure.line + "\n");
            session.errors.flush();
            worst = std::max(worst, failure.status);
        }
    }
    return worst;
}

void VerifyCommand::verify(Session& session, const std::string& file) {
    const PathArchive archive = openArchive(file, session.interrupts);
    ProgressBar bar(barVisibility(session, Writes::Nothing));
    bar.begin("verifying", ProgressUnit::Steps, 0);
    ScanOptions options;
    options.threads = threads();
    options.progress = [&bar](std::uint64_t done, std::uint64_t total) {
        bar.update(done, total);
    };
    const auto damages =
        inFile(file, [&] { return archive.findDamage(options); });
    bar.finish();
    for (const ArchiveDamage& damage : damages)
        session.output.write(fmt::format("{}: {}\n", file, textOf(damage)));
    if (!damages.empty())
        throw ConsoleException(
            ExitStatus::Damaged,
            fmt::format("{}: damaged in {} place{}; `tessel list "
                        "--salvage` reads what is left",
                        file, damages.size(), damages.size() == 1 ? "" : "s"));
    if (!isQuiet())
        session.output.write(
            fmt::format("{}: intact, {} paths\n", file, archive.size()));
}

}  // namespace tessel::console
