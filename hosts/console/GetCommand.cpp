#include "hosts/console/GetCommand.hpp"

#include <fmt/format.h>

#include <algorithm>
#include <random>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/ConsoleException.hpp"
#include "hosts/console/Failure.hpp"
#include "hosts/console/RandomSample.hpp"
#include "hosts/console/RecordReader.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description getDescription = {
    "get", "Write the paths with these numbers, in the order asked",
    "  tessel get files.tessel 0           the first path\n"
    "  tessel get files.tessel -1          the last one\n"
    "  tessel get files.tessel 100-199 7   a range, then one more\n"
    "  tessel get files.tessel -10--1      the last ten\n"
    "  tessel get files.tessel - < numbers.txt\n"
    "  tessel get files.tessel --random 20 --seed 1"};

std::string outOfRange(const std::string& where, std::uint64_t size) {
    if (size == 0) return where + " is out of range; the archive is empty";
    return fmt::format(
        "{} is out of range; numbers go from 0 to {}, or from "
        "-{} to -1, and ranges upwards",
        where, size - 1, size);
}

}  // namespace

GetCommand::GetCommand() : Command(getDescription) {
    line().argument("FILE", file_, "The archive, or - for standard input");
    line().arguments("N", words_, CommandLine::Need::Optional,
                     "Numbers from 0, negative ones from the end; N-M is a "
                     "range with both ends; - reads one of these per line "
                     "from standard input");
    line().flag("-0", nul_, "End each path with NUL instead of newline");
    line().number("--random", "K", sampleSize_,
                  "Write K different paths, drawn at random, in the order of "
                  "their numbers");
    line().number("--seed", "S", seed_,
                  "Draw the same paths each time that S is the same");
}

ExitStatus GetCommand::run(Session& session) {
    if (words_.empty() == !sampleSize_)
        line().fail("give either numbers or --random K");
    if (seed_ && !sampleSize_) line().fail("--seed needs --random");
    const bool readsNumbers = std::ranges::count(words_, "-") > 0;
    if (readsNumbers && file_ == "-")
        line().fail("standard input cannot be both the archive and numbers");
    static_cast<void>(parsedWords());  // a wrong word is told before all else
    const PathArchive archive = openArchive(file_, session.interrupts);
    PathOutput output(session.output,
                      nul_ ? Separator::Nul : Separator::Newline,
                      Numbering::None);
    ProgressBar bar(barVisibility(session, Writes::Paths,
                                  readsNumbers ? Reads::Input : Reads::Files));
    NumberedPaths paths(archive, output, bar);
    inFile(file_, [&] {
        const auto requests = resolvedWords(archive.size());
        bar.begin("fetching", ProgressUnit::Paths, pathsIn(requests));
        if (sampleSize_) sample(archive, paths);
        for (const Request& request : requests)
            if (request)
                paths.add(*request);
            else
                answerInput(session, archive, paths);
        paths.flush();
    });
    return ExitStatus::Success;
}

// The ranges of all words but "-".
std::vector<PathRange> GetCommand::parsedWords() const {
    std::vector<PathRange> ranges;
    for (const std::string& word : words_) {
        if (word == "-") continue;
        const auto range = parsePathRange(word);
        if (!range)
            throw ConsoleException(
                ExitStatus::Usage,
                fmt::format("'{}' is no number or range; see `tessel get "
                            "--help`",
                            word));
        ranges.push_back(*range);
    }
    return ranges;
}

std::vector<GetCommand::Request> GetCommand::resolvedWords(
    std::uint64_t size) const {
    std::vector<Request> requests;
    const std::vector<PathRange> ranges = parsedWords();
    auto next = ranges.begin();
    for (const std::string& word : words_) {
        if (word == "-") {
            requests.emplace_back();
            continue;
        }
        requests.push_back(resolve(*next++, size));
        if (!requests.back())
            throw ConsoleException(
                ExitStatus::BadInput,
                fmt::format("{}: {}", file_, outOfRange(word, size)));
    }
    return requests;
}

// How many paths are asked for; 0 if that is not known.
std::uint64_t GetCommand::pathsIn(
    const std::vector<Request>& requests) const noexcept {
    std::uint64_t paths = sampleSize_.value_or(0);
    for (const Request& request : requests) {
        if (!request) return 0;
        paths += request->end - request->begin;
    }
    return paths;
}

void GetCommand::answerInput(Session& session, const PathArchive& archive,
                             NumberedPaths& paths) const {
    InputFile input("-", session.interrupts);
    RecordReader records(input, Separator::Newline);
    const auto fail = [&](const std::string& problem) {
        paths.flush();
        throw ConsoleException(ExitStatus::BadInput,
                               fmt::format("{}: {} (line {})", input.name(),
                                           problem, records.line()));
    };
    for (;;) {
        // Whoever asks and waits for the answer gets it now.
        if (!records.hasNext()) {
            paths.flush();
            session.output.flush();
        }
        const auto record = records.next();
        if (!record) return;
        const auto range = parsePathRange(*record);
        if (!range) fail(fmt::format("'{}' is no number or range", *record));
        const auto numbers = resolve(*range, archive.size());
        if (!numbers) fail(outOfRange(std::string(*record), archive.size()));
        paths.add(*numbers);
    }
}

void GetCommand::sample(const PathArchive& archive,
                        NumberedPaths& paths) const {
    if (*sampleSize_ > archive.size())
        throw ConsoleException(
            ExitStatus::BadInput,
            fmt::format("{}: cannot draw {} different paths from {}; ask for "
                        "fewer",
                        file_, *sampleSize_, archive.size()));
    std::random_device device;
    const std::uint64_t seed =
        seed_ ? *seed_ : std::uint64_t{device()} << 32 | device();
    drawSample(*sampleSize_, archive.size(), seed,
               [&](std::uint64_t number) { paths.add(number); });
}

}  // namespace tessel::console
