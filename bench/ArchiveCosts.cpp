#include "bench/ArchiveCosts.hpp"

#include <unistd.h>

#include <filesystem>
#include <iostream>
#include <optional>
#include <random>
#include <vector>

#include "archive/PathArchive.hpp"
#include "bench/Heap.hpp"
#include "bench/Report.hpp"
#include "bench/Timing.hpp"
#include "paths/PathList.hpp"

namespace bench {

using tessel::ArchiveOptions;
using tessel::ArchiveWriter;
using tessel::PathArchive;
using tessel::paths::PathList;

namespace {

constexpr std::size_t gets = 1000;

// Times and ratios are medians of all runs.
struct ArchiveCosts {
    std::size_t paths = 0;
    std::uint64_t fileBytes = 0;
    double openSeconds = 0;
    std::size_t heapBytes = 0;  // of an open archive after random gets
    double secondCore = 0;      // build on one core / on two
};

// A file of this process, removed at the end.
class TemporaryFile {
public:
    TemporaryFile()
        : name_(std::filesystem::temp_directory_path() /
                ("path-bench." + std::to_string(::getpid()) + ".tessel")) {}
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    ~TemporaryFile() {
        std::error_code ignored;
        std::filesystem::remove(name_, ignored);
    }
    std::string name() const { return name_.string(); }

private:
    std::filesystem::path name_;
};

std::uint64_t build(const PathList& list, unsigned threads,
                    const std::string& file) {
    ArchiveOptions options;
    options.threads = threads;
    ArchiveWriter writer(file, options);
    for (std::size_t i = 0; i < list.size(); ++i) writer.add(list[i]);
    return writer.finish();
}

void readRandomPaths(const PathArchive& archive) {
    std::mt19937_64 random(1);
    std::uniform_int_distribution<std::uint64_t> any(0, archive.size() - 1);
    std::string path;
    for (std::size_t i = 0; i < gets; ++i) {
        archive.read(any(random), path);
        keep(path);
    }
}

ArchiveCosts costsOf(const PathList& list, int runs) {
    const TemporaryFile file;
    ArchiveCosts costs;
    costs.paths = list.size();
    std::vector<double> alone;
    std::vector<double> together;
    std::vector<double> opening;
    for (int run = 0; run < runs; ++run) {
        alone.push_back(
            secondsOf([&] { costs.fileBytes = build(list, 1, file.name()); }));
        together.push_back(secondsOf([&] { build(list, 2, file.name()); }));
        const std::size_t before = heapInUse();
        std::optional<PathArchive> archive;
        opening.push_back(
            secondsOf([&] { archive = PathArchive::open(file.name()); }));
        readRandomPaths(*archive);
        costs.heapBytes = heapInUse() - before;
    }
    costs.openSeconds = median(opening);
    costs.secondCore = medianRatio(alone, together);
    return costs;
}

}  // namespace

void measureArchive(const std::string& listName, const Options& options) {
    tessel::paths::WalkReport report;
    const PathList list = tessel::paths::readPaths(listName, report);
    const ArchiveCosts costs = costsOf(list, options.runs);
    Table table({"archive of " + grouped(costs.paths) + " paths", ""});
    table.row({"bytes of the file", grouped(costs.fileBytes)});
    table.row({"ms to open it", threeDigits(costs.openSeconds * 1e3)});
    table.row({"bytes on the heap after " + grouped(gets) + " random gets",
               grouped(costs.heapBytes)});
    table.row({"build on one core / on two", fixed(costs.secondCore, 2)});
    std::cout << table.text();
    if (options.jsonFile.empty()) return;
    Json json;
    json.number("paths", static_cast<double>(costs.paths))
        .number("fileBytes", static_cast<double>(costs.fileBytes))
        .number("openSeconds", costs.openSeconds)
        .number("heapBytes", static_cast<double>(costs.heapBytes))
        .number("secondCore", costs.secondCore);
    writeJson(options.jsonFile, Json().object("archive", json));
}

}  // namespace bench
