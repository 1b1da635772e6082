#include "hosts/console/DiffCommand.hpp"

#include <compare>

#include "archive/PathArchive.hpp"
#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/PathSet.hpp"

namespace tessel::console {

namespace {

constexpr Command::Description diffDescription = {
    "diff", "Tell which paths are only in A (-) and only in B (+)",
    "  tessel diff yesterday.tessel today.tessel\n"
    "  tessel diff a.tessel b.tessel | grep -c '^+'"};

// Which set's path comes next in byte order; equal if it is in both.
std::strong_ordering compare(const PathSet& before, const PathSet& after) {
    if (!after.path()) return std::strong_ordering::less;
    if (!before.path()) return std::strong_ordering::greater;
    return *before.path() <=> *after.path();
}

// Calls write(sign, path) for each difference. Returns whether there is one.
template <class Write>
bool writeDifferences(PathSet& before, PathSet& after, ProgressBar& bar,
                      Write write) {
    bool differ = false;
    for (std::uint64_t step = 0; before.path() || after.path(); ++step) {
        if (step % 4096 == 0)
            bar.update(before.pathsRead() + after.pathsRead());
        const auto order = compare(before, after);
        if (std::is_lt(order)) write("- ", *before.path());
        if (std::is_gt(order)) write("+ ", *after.path());
        differ |= std::is_neq(order);
        // advance() changes what the order was taken from.
        if (std::is_lteq(order)) before.advance();
        if (std::is_gteq(order)) after.advance();
    }
    return differ;
}

}  // namespace

DiffCommand::DiffCommand() : Command(diffDescription) {
    line().argument("A", before_, "An archive, or - for standard input");
    line().argument("B", after_, "An archive, or - for standard input");
    line().flag("-0", nul_, "End each path with NUL instead of newline");
}

ExitStatus DiffCommand::run(Session& session) {
    if (before_ == "-" && after_ == "-")
        line().fail("standard input cannot be both archives");
    const PathArchive first = openArchive(before_, session.interrupts);
    const PathArchive second = openArchive(after_, session.interrupts);
    ProgressBar bar(barVisibility(session, Writes::Paths));
    PathSet before(first, before_, bar);
    PathSet after(second, after_, bar);
    bar.begin("comparing", ProgressUnit::Paths, first.size() + second.size());
    const bool differ =
        writeDifferences(before, after, bar,
                         [&](std::string_view sign, const std::string& path) {
                             session.output.write(sign);
                             session.output.write(path);
                             session.output.put(nul_ ? '\0' : '\n');
                         });
    return differ ? ExitStatus::NoMatch : ExitStatus::Success;
}

}  // namespace tessel::console
