#include "hosts/console/FindCommand.hpp"

#include <fmt/format.h>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/PathOutput.hpp"
#include "hosts/console/Terminal.hpp"
#include "hosts/patterns/PatternException.hpp"

namespace tessel::console {

using patterns::LetterCase;
using patterns::PathMatcher;
using patterns::PatternKind;

namespace {

constexpr Command::Description findDescription = {
    "find", "Write the paths that contain every TEXT",
    "  tessel find files.tessel stdio.h\n"
    "  tessel find files.tessel python3 test --count\n"
    "  tessel find files.tessel --glob '*.hpp'\n"
    "  tessel find files.tessel --glob 'usr/*/doc/*'\n"
    "  tessel find files.tessel --regex -i '/readme(\\.md)?$'\n"
    "  tessel find files.tessel -0 .conf --folder etc | xargs -0 grep PATH\n"
    "\n"
    "A glob has to match the whole path; one without '/' only the last\n"
    "component. '*' and '?' match '/', too. A regular expression (RE2) may\n"
    "match anywhere in the path."};

std::vector<std::string_view> viewsOf(const std::vector<std::string>& texts) {
    return {texts.begin(), texts.end()};
}

}  // namespace

FindCommand::FindCommand() : Command(findDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().arguments("TEXT", patterns_, CommandLine::Need::Required,
                     "What paths have to contain, or a pattern");
    line().flag("--glob", glob_, "Each TEXT is a shell pattern");
    line().flag("--regex", regex_, "Each TEXT is a regular expression (RE2)");
    line().flag("-i", ignoreCase_, "Ignore the case of letters");
    line().value("--folder", "F", folder_, "Only paths below the folder F");
    line().flag("--count", count_, "Write only how many paths match");
    line().flag("--numbers", numbers_,
                "Write each path's number and a tab before it");
    line().flag("-0", nul_, "End each path with NUL instead of newline");
    addThreads();
}

ExitStatus FindCommand::run(Session& session) {
    const PathMatcher matcher = this->matcher();
    const PathArchive archive = openArchive(file_, session.interrupts);
    ProgressBar bar(
        barVisibility(session, count_ ? Writes::Nothing : Writes::Paths));
    bar.begin("searching", ProgressUnit::Steps, 0);
    const FindOptions options = this->options(bar);
    const std::uint64_t found = inFile(file_, [&] {
        return count_ ? count(archive, matcher, options)
                      : write(session, archive, matcher, options);
    });
    if (count_) session.output.write(fmt::format("{}\n", found));
    return found == 0 ? ExitStatus::NoMatch : ExitStatus::Success;
}

PatternKind FindCommand::kind() const {
    if (glob_ && regex_) line().fail("--glob and --regex exclude each other");
    if (glob_) return PatternKind::Glob;
    return regex_ ? PatternKind::Expression : PatternKind::Text;
}

PathMatcher FindCommand::matcher() const {
    try {
        return {patterns_, kind(),
                ignoreCase_ ? LetterCase::Ignored : LetterCase::Exact};
    } catch (const patterns::PatternException& wrong) {
        line().fail(wrong.what());
    }
}

FindOptions FindCommand::options(ProgressBar& bar) const {
    FindOptions options;
    options.threads = threads();
    options.folder = folder_;
    options.progress = [&bar](std::uint64_t done, std::uint64_t total) {
        bar.update(done, total);
    };
    return options;
}

std::uint64_t FindCommand::count(const PathArchive& archive,
                                 const PathMatcher& matcher,
                                 const FindOptions& options) const {
    if (isPlain()) return archive.find(viewsOf(patterns_), options).size();
    return archive
        .find([&](std::string_view path) { return matcher.matches(path); },
              options)
        .size();
}

std::uint64_t FindCommand::write(Session& session, const PathArchive& archive,
                                 const PathMatcher& matcher,
                                 const FindOptions& options) const {
    PathOutput output(session.output,
                      nul_ ? Separator::Nul : Separator::Newline,
                      numbers_ ? Numbering::Numbers : Numbering::None);
    if (showsColours(session.output.descriptor())) output.colour(matcher);
    std::uint64_t found = 0;
    const auto show = [&](std::uint64_t number, std::string_view path) {
        output.write(number, path);
        ++found;
    };
    if (isPlain())
        archive.findEach(viewsOf(patterns_), show, options);
    else
        archive.findEach(
            [&](std::string_view path) { return matcher.matches(path); }, show,
            options);
    return found;
}

}  // namespace tessel::console
