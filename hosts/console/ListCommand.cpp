#include "hosts/console/ListCommand.hpp"

#include <fmt/format.h>

#include "archive/NumberLookup.hpp"
#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/InputFile.hpp"
#include "hosts/console/ListReader.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description listDescription = {
    "list", "Write all paths of an archive, in the order of their numbers",
    "  tessel list files.tessel | less\n"
    "  tessel list files.tessel --folder usr/share/doc\n"
    "  tessel list files.tessel -0 | xargs -0 ls -ld --\n"
    "  tessel list damaged.tessel --salvage > rescued.txt"};

std::string textOf(const NumberRange& range) {
    if (range.end - range.begin == 1) return std::to_string(range.begin);
    return fmt::format("{}-{}", range.begin, range.end - 1);
}

// "12 lost: 0-7, 100, 200-202", for standard error.
std::string lossText(const SalvageReport& report) {
    std::uint64_t lost = 0;
    std::string ranges;
    for (const NumberRange& range : report.lost) {
        lost += range.end - range.begin;
        ranges += (ranges.empty() ? ": " : ", ") + textOf(range);
    }
    return fmt::format("{} paths kept, {} lost{}{}", report.kept, lost, ranges,
                       report.complete
                           ? ""
                           : "; more may be lost after the last number, since "
                             "the archive's size is not known");
}

}  // namespace

ListCommand::ListCommand() : Command(listDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().flag("-0", nul_, "End each path with NUL instead of newline");
    line().flag("--numbers", numbers_,
                "Write each path's number and a tab before it");
    line().value("--folder", "F", folder_, "Only paths below the folder F");
    line().flag("--salvage", salvage_,
                "Read a damaged archive: write every path that is intact, and "
                "tell on standard error which are lost");
}

ExitStatus ListCommand::run(Session& session) {
    return salvage_ ? salvage(session) : list(session);
}

Separator ListCommand::separator() const noexcept {
    return nul_ ? Separator::Nul : Separator::Newline;
}

Numbering ListCommand::numbering() const noexcept {
    return numbers_ ? Numbering::Numbers : Numbering::None;
}

ExitStatus ListCommand::list(Session& session) const {
    const PathArchive archive = openArchive(file_, session.interrupts);
    const ListReader reader(archive, separator(), numbering());
    ProgressBar bar(barVisibility(session, Writes::Paths));
    return inFile(file_, [&] {
        const auto ranges = archive.folder(folder_.value_or(""));
        std::uint64_t total = 0;
        for (const NumberRange& range : ranges)
            total += range.end - range.begin;
        bar.begin("listing", ProgressUnit::Paths, total);
        std::uint64_t done = 0;
        for (const NumberRange& range : ranges)
            reader.read(range, [&](std::string_view text, std::uint64_t paths) {
                session.output.write(text);
                bar.update(done += paths);
            });
        const bool isPart = folder_ && !folder_->empty();
        return isPart && total == 0 ? ExitStatus::NoMatch : ExitStatus::Success;
    });
}

SalvageReport ListCommand::salvageFrom(InputFile& input,
                                       PathVisitor visitor) const {
    try {
        return input.isRegular() && file_ != "-"
                   ? PathArchive::salvage(file_, visitor)
                   : PathArchive::salvage(input.readAll(), visitor);
    } catch (const DamagedArchiveException& damage) {
        // Nothing was found, so that no other command finds more.
        throw ConsoleException(ExitStatus::Damaged,
                               fmt::format("{}: {}; nothing can be read from "
                                           "it",
                                           input.name(), damage.what()));
    }
}

ExitStatus ListCommand::salvage(Session& session) const {
    const std::string prefix = archive::prefixOf(folder_.value_or(""));
    PathOutput paths(session.output, separator(), numbering());
    ProgressBar bar(barVisibility(session, Writes::Paths));
    bar.begin("salvaging", ProgressUnit::Paths, 0);
    std::uint64_t read = 0;
    const auto write = [&](std::uint64_t number, std::string_view path) {
        if (path.starts_with(prefix)) paths.write(number, path);
        if (++read % 4096 == 0) bar.update(read);
    };
    InputFile input(file_, session.interrupts);
    const SalvageReport report =
        inFile(input.name(), [&] { return salvageFrom(input, write); });
    bar.finish();
    session.output.flush();
    if (report.lost.empty() && report.complete && report.damages.empty()) {
        session.errors.write(fmt::format(
            "tessel: {}: nothing is lost, all {} paths are intact\n",
            input.name(), report.kept));
        return ExitStatus::Success;
    }
    throw ConsoleException(
        ExitStatus::Damaged,
        fmt::format("{}: {}", input.name(), lossText(report)));
}

}  // namespace tessel::console
