#include "hosts/console/ExportCommand.hpp"

#include <ranges>
#include <string_view>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/OutputFile.hpp"
#include "paths/PathStore.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description description = {
    "export", "Write an archive's paths as a store, which can grow",
    "  tessel export files.tessel -o files.store\n"
    "  tessel pack files.store -o files.tessel   the way back"};

}  // namespace

ExportCommand::ExportCommand() : Command(description) {
    line().argument("FILE", file_, CommandLine::Need::Required,
                    "The archive, or - for standard input");
    line().value("-o", "STORE", store_, CommandLine::Need::Required,
                 "The store to write, or - for standard output");
    line().flag("-f", force_, "Replace STORE if it exists");
}

ExitStatus ExportCommand::run(Session& session) {
    checkNoTerminal(store_, session);
    checkOverwrite(store_, force_ ? Overwrite::Allowed : Overwrite::Refused);
    const PathArchive archive = openArchive(file_, session.interrupts);
    session.interrupts.tidyUpFirst();
    ProgressBar bar(barVisibility(session, Writes::Nothing));
    bar.begin("reading", ProgressUnit::Paths, archive.size());
    std::uint64_t done = 0;
    const auto counted = [&](std::string_view path) {
        if (++done % 4096 == 0) {
            session.interrupts.throwIfStopped();
            bar.update(done);
        }
        return path;
    };
    const PathStore store = inFile(file_, [&] {
        return PathStore::from(
            std::ranges::subrange(archive.begin(), archive.end()) |
            std::views::transform(counted));
    });
    session.interrupts.throwIfStopped();
    replaceFile(store_, store.save(), session);
    return ExitStatus::Success;
}

}  // namespace tessel::console
