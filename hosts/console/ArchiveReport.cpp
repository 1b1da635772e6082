#include "hosts/console/ArchiveReport.hpp"

#include <fmt/format.h>

#include <iterator>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "hosts/console/ArchiveFile.hpp"
#include "hosts/console/JsonText.hpp"
#include "hosts/console/OrderedPaths.hpp"
#include "hosts/console/Quantities.hpp"

namespace tessel::console {

namespace {

std::string_view folderOf(std::string_view path) noexcept {
    return path.substr(0, path.rfind('/') + 1);
}

// Each segment counts its own folders; of several, the same may be in two.
std::uint64_t countFolders(const PathArchive& archive) {
    std::unordered_set<std::string> folders;
    std::string last;
    archive.forEach([&](std::uint64_t number, std::string_view path) {
        const std::string_view folder = folderOf(path);
        if (number > 0 && folder == last) return;
        last.assign(folder);
        folders.insert(last);
    });
    return folders.size();
}

double percent(std::uint64_t part, std::uint64_t all) noexcept {
    return all == 0
               ? 0
               : 100 * static_cast<double>(part) / static_cast<double>(all);
}

}  // namespace

ArchiveReport reportOn(const PathArchive& archive, std::string file,
                       ProgressBar& bar) {
    ArchiveReport report;
    report.file = std::move(file);
    report.info = archive.info();
    report.textBytes = listBytes(report.info);
    report.folders =
        report.info.segments > 1 ? countFolders(archive) : report.info.folders;
    OrderedPaths paths(archive, bar);
    bar.begin("counting", ProgressUnit::Paths, archive.size());
    std::string last;
    for (std::uint64_t done = 0; const auto path = paths.next(); ++done) {
        if (done % 4096 == 0) bar.update(done);
        report.lengths.add(path->size());
        if (done > 0 && *path == last) ++report.repeats;
        last.assign(*path);
    }
    return report;
}

std::string tableOf(const ArchiveReport& report) {
    const ArchiveInfo& info = report.info;
    std::string text;
    const auto to = std::back_inserter(text);
    const auto line = [&](std::string_view name, std::uint64_t value,
                          const std::string& more) {
        fmt::format_to(to, "{:<24}{:>16}{}\n", name, groupedText(value), more);
    };
    line("paths", info.paths, "");
    line("folders", report.folders, "");
    line("repeats", report.repeats, "");
    line(
        "text", report.textBytes,
        fmt::format(" B {:9.2f} B per path", report.perPath(report.textBytes)));
    line("file", info.fileBytes,
         fmt::format(" B {:9.2f} B per path {:6.2f} % of the text",
                     report.perPath(info.fileBytes),
                     percent(info.fileBytes, report.textBytes)));
    line("segments", info.segments, "");
    line("format version", info.formatVersion, "");
    line("shortest path", report.lengths.shortest(), " B");
    line("median path", report.lengths.median(), " B");
    line("longest path", report.lengths.longest(), " B");
    text += "\nHow the file's bytes divide\n";
    for (const auto& section : info.sections)
        line("  " + section.name, section.bytes,
             fmt::format(" B {:9.2f} B per path {:6.2f} %",
                         report.perPath(section.bytes),
                         percent(section.bytes, info.fileBytes)));
    return text;
}

std::string jsonOf(const ArchiveReport& report) {
    const ArchiveInfo& info = report.info;
    Json sections = Json::array();
    for (const auto& section : info.sections)
        sections.push_back({{"name", section.name}, {"bytes", section.bytes}});
    const Json json = {{"file", jsonOfBytes(report.file)},
                       {"formatVersion", info.formatVersion},
                       {"paths", info.paths},
                       {"folders", report.folders},
                       {"repeats", report.repeats},
                       {"segments", info.segments},
                       {"textBytes", report.textBytes},
                       {"fileBytes", info.fileBytes},
                       {"bytesPerPath", report.perPath(info.fileBytes)},
                       {"shortestPath", report.lengths.shortest()},
                       {"medianPath", report.lengths.median()},
                       {"longestPath", report.lengths.longest()},
                       {"longestName", info.longestName},
                       {"longestFolder", info.longestFolder},
                       {"sections", sections}};
    return json.dump(2) + "\n";
}

}  // namespace tessel::console
