#include "hosts/console/PackCommand.hpp"

#include <fmt/format.h>

#include <chrono>
#include <cstdint>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "archive/FileTarget.hpp"
#include "archive/PathArchive.hpp"
#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/OutputFile.hpp"
#include "hosts/console/Terminal.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description packDescription = {
    "pack", "Pack a list of paths into an archive",
    "  find /usr | tessel pack -o usr.tessel\n"
    "  find . -print0 | tessel pack -0 -o here.tessel\n"
    "  tessel pack list.txt -o list.tessel --level best\n"
    "  tessel pack --walk /home -o home.tessel\n"
    "  tessel pack more.txt -o list.tessel --append\n"
    "  tessel pack files.store -o files.tessel"};

using Clock = std::chrono::steady_clock;

ArchiveLevel levelOf(std::string_view name) noexcept {
    if (name == "fast") return ArchiveLevel::Fast;
    return name == "best" ? ArchiveLevel::Best : ArchiveLevel::Normal;
}

// What was packed, for the line at the end.
struct Totals {
    std::uint64_t paths = 0;
    std::uint64_t textBytes = 0;  // with one separator per path
    std::uint64_t fileBytes = 0;
};

std::string lineOf(const Totals& totals, double seconds) {
    const double perPath = totals.paths == 0
                               ? 0
                               : static_cast<double>(totals.fileBytes) /
                                     static_cast<double>(totals.paths);
    return fmt::format(
        "{} paths, {} bytes of text, {} bytes in the file, {:.2f} bytes per "
        "path, {:.2f} s",
        totals.paths, totals.textBytes, totals.fileBytes, perPath, seconds);
}

}  // namespace

// Takes the paths, and puts the archive in its place at the end.
class PackCommand::Target {
public:
    Target(const PackCommand& command, Session& session, ProgressBar& bar)
        : file_(command.file_),
          session_(&session),
          appends_(command.append_ && exists(command.file_)),
          writer_(makeWriter(optionsFor(command, session, bar))) {
        if (appends_) countOld();
    }

    void add(std::string_view path) {
        writer_.add(path);
        totals_.textBytes += path.size() + 1;
    }

    bool appends() const noexcept { return appends_; }
    std::uint64_t oldPaths() const noexcept { return oldPaths_; }

    Totals finish() {
        totals_.paths = writer_.size();
        totals_.fileBytes = writer_.finish();
        if (file_ == "-") replaceFile(file_, bytes_, *session_);
        return totals_;
    }

private:
    static ArchiveOptions optionsFor(const PackCommand& command,
                                     const Session& session, ProgressBar& bar) {
        ArchiveOptions options;
        options.level = levelOf(command.level_);
        options.threads = command.threads();
        options.cancel = session.interrupts.token();
        options.progress = [&bar, shown = false](
                               const ArchiveProgress& progress) mutable {
            const std::uint64_t paths =
                progress.pathsAdded - progress.pathsWritten;
            if (!shown || progress.share >= 1)
                bar.begin("packing", ProgressUnit::Paths, paths);
            shown = progress.share < 1;
            bar.update(static_cast<std::uint64_t>(progress.share *
                                                  static_cast<double>(paths)));
        };
        return options;
    }

    ArchiveWriter makeWriter(const ArchiveOptions& options) {
        if (file_ == "-") return ArchiveWriter(bytes_, options);
        return appends_ ? ArchiveWriter::append(file_, options)
                        : ArchiveWriter(file_, options);
    }

    void countOld() {
        totals_.textBytes = listBytes(PathArchive::open(file_).info());
        oldPaths_ = writer_.size();
    }

    std::string file_;
    Session* session_;
    bool appends_;
    std::vector<std::uint8_t> bytes_;  // of an archive to standard output
    Totals totals_;
    std::uint64_t oldPaths_ = 0;
    ArchiveWriter writer_;
};

PackCommand::PackCommand() : Command(packDescription) {
    line().argument("LIST", list_,
                    "The list, - for standard input (default); paths end with "
                    "newline. A saved store or an archive is a list, too");
    line().value("-o", "FILE", file_, CommandLine::Need::Required,
                 "The archive to write, or - for standard output");
    line().flag("-0", nul_, "Paths end with NUL instead of newline");
    line().flag("--skip-empty", skipEmpty_,
                "Leave out empty lines, which are an error otherwise");
    line().value("--walk", "FOLDER", folder_,
                 "Pack the files and links below FOLDER instead of a list");
    line().flag("--folders", showFolders_, "With --walk: pack folders, too");
    line().flag("--append", append_,
                "Add to FILE if it exists; numbers go on after its last");
    line().flag("-f", force_, "Replace FILE if it exists");
    line().choice("--level", {"fast", "normal", "best"}, level_,
                  "How much time to spend on size (default: normal)");
    addThreads();
}

ExitStatus PackCommand::run(Session& session) {
    const auto start = Clock::now();
    checkWords(session);
    session.interrupts.tidyUpFirst();
    ProgressBar bar(barVisibility(session, Writes::Nothing));
    ListInput input({nul_ ? Separator::Nul : Separator::Newline,
                     skipEmpty_ ? EmptyLines::Skipped : EmptyLines::Refused},
                    session, bar);
    const std::string text = inFile(file_, [&] {
        Target target(*this, session, bar);
        readInput(input, [&](std::string_view path) { target.add(path); });
        const Totals totals = target.finish();
        const std::chrono::duration<double> seconds = Clock::now() - start;
        std::string line = lineOf(totals, seconds.count());
        if (target.appends())
            line += fmt::format("; {} paths added",
                                totals.paths - target.oldPaths());
        return line;
    });
    bar.finish();
    if (isQuiet()) return ExitStatus::Success;
    OutputBuffer& told = file_ == "-" ? session.errors : session.output;
    told.write(text);
    if (skipEmpty_)
        told.write(
            fmt::format("; {} empty lines skipped", input.skippedLines()));
    told.put('\n');
    return ExitStatus::Success;
}

void PackCommand::checkWords(const Session& session) const {
    if (append_ && force_) line().fail("--append and -f exclude each other");
    if (append_ && file_ == "-") line().fail("--append needs a file");
    if (folder_ && list_) line().fail("give either a list or --walk FOLDER");
    if (showFolders_ && !folder_) line().fail("--folders needs --walk");
    if (!folder_ && !list_ && isTerminal(0))
        line().fail("no list given; name a file, use a pipe, or - to type it");
    checkNoTerminal(file_, session);
    checkOverwrite(file_,
                   force_ || append_ ? Overwrite::Allowed : Overwrite::Refused);
}

void PackCommand::readInput(ListInput& input,
                            const ListInput::Sink& sink) const {
    if (folder_)
        input.walk(*folder_, showFolders_, [&](std::string_view path) {
            // The archive may be written below the folder that is walked.
            if (!archive::FileTarget::isHiddenFile(file_, path)) sink(path);
        });
    else
        input.readList(list_.value_or("-"), sink);
}

}  // namespace tessel::console
