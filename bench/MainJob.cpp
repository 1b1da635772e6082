#include "bench/MainJob.hpp"

#include <sys/resource.h>

#include <algorithm>
#include <iostream>
#include <optional>
#include <span>
#include <utility>

#include "bench/PathReader.hpp"
#include "bench/Report.hpp"
#include "bench/Timing.hpp"
#include "paths/IndexedRange.hpp"
#include "paths/PathList.hpp"
#include "paths/PathStore.hpp"

namespace bench {

using tessel::PathStore;
using tessel::paths::PathList;

namespace {

constexpr std::size_t randomReads = 100'000;

struct Step {
    const char* name;
    double seconds;
    std::size_t paths;
};

struct Measurements {
    std::size_t paths = 0;
    std::size_t textBytes = 0;
    PathStore::MemoryUsage memory;
    std::size_t storedBytes = 0;
    std::vector<Step> steps;
};

// Compares paths that come one by one with those of the list.
class ListComparison {
public:
    ListComparison(const PathList& list, const char* route)
        : list_(&list), route_(route) {}

    // Path `position`, counted from 0, came back as `path`.
    void expect(std::size_t position, std::string_view path) {
        ++count_;
        if (difference_) return;
        const bool isThere = position < list_->size();
        if (isThere && path == (*list_)[position]) return;
        difference_ =
            std::string(route_) + ": path " + std::to_string(position) +
            " should be\n  " +
            (isThere ? std::string((*list_)[position]) : "(after the last)") +
            "\nand is\n  " + std::string(path);
    }

    // The first difference, which may be in the number of paths.
    std::optional<std::string> result(std::size_t wanted) const {
        if (difference_ || count_ == wanted) return difference_;
        return std::string(route_) + ": " + std::to_string(count_) +
               " paths instead of " + std::to_string(wanted);
    }

private:
    const PathList* list_;
    const char* route_;
    std::size_t count_ = 0;
    std::optional<std::string> difference_;
};

// The job, step by step. Each step is timed under its name.
class MainJob {
public:
    std::optional<std::string> run(const std::string& listOrFolder) {
        step("read the list",
             [&] { list_ = tessel::paths::readPaths(listOrFolder, walk); });
        results.paths = list_.size();
        results.textBytes = list_.textBytes();
        PathStore store;
        step("build", [&] { store = built(); });
        results.memory = store.memoryUsage();
        const PathStore loaded = throughBytes(std::move(store));
        time(loaded);
        return compare(loaded);
    }

    Measurements results;
    tessel::paths::WalkReport walk;

private:
    template <class Call>
    void step(const char* name, Call call) {
        results.steps.push_back({name, secondsOf(call), 0});
        results.steps.back().paths = list_.size();
    }

    PathStore built() const {
        return PathStore::from(tessel::paths::IndexedRange(
            0, list_.size(), [&](std::size_t i) { return list_[i]; }));
    }

    // Saves the store, releases it, and loads another one.
    PathStore throughBytes(PathStore store) {
        std::vector<std::uint8_t> bytes;
        step("save", [&] { bytes = store.save(); });
        results.storedBytes = bytes.size();
        store = PathStore();
        step("load", [&] { store = PathStore::load(bytes); });
        return store;
    }

    void time(const PathStore& store) {
        step("iterate", [&] {
            for (const std::string_view path : store) keep(path);
        });
        step("iterate in tree order", [&] {
            store.forEachInTreeOrder([](std::string_view path) { keep(path); });
        });
        std::string path;
        const auto numbers = randomNumbers(randomReads, list_.size());
        step("read at random", [&] {
            for (const std::size_t number : numbers) {
                store.read(number - 1, path);
                keep(path);
            }
        });
        results.steps.back().paths = numbers.size();
    }

    std::optional<std::string> compare(const PathStore& store) {
        std::optional<std::string> difference;
        step("compare", [&] {
            difference = compareByNumber(store);
            if (!difference) difference = compareRandom(store);
            if (!difference) difference = compareTreeOrder(store);
        });
        return difference;
    }

    std::optional<std::string> compareByNumber(const PathStore& store) const {
        ListComparison comparison(list_, "by number");
        store.read(0, store.size(), [&](std::size_t i, std::string_view path) {
            comparison.expect(i, path);
        });
        return comparison.result(list_.size());
    }

    std::optional<std::string> compareRandom(const PathStore& store) const {
        ListComparison comparison(list_, "at random");
        for (const std::size_t number :
             randomNumbers(randomReads, list_.size())) {
            comparison.expect(number - 1, store[number - 1]);
        }
        return comparison.result(randomReads);
    }

    // The order is the tree's own, so both sides are sorted.
    std::optional<std::string> compareTreeOrder(const PathStore& store) const {
        std::vector<std::string> met;
        met.reserve(list_.size());
        store.forEachInTreeOrder(
            [&](std::string_view path) { met.emplace_back(path); });
        std::ranges::sort(met);
        std::vector<std::size_t> order(list_.size());
        for (std::size_t i = 0; i < order.size(); ++i) order[i] = i;
        std::ranges::sort(order, {}, [&](std::size_t i) { return list_[i]; });
        ListComparison comparison(list_, "in tree order");
        for (std::size_t i = 0; i < met.size(); ++i) {
            comparison.expect(i < order.size() ? order[i] : i, met[i]);
        }
        return comparison.result(list_.size());
    }

    PathList list_;
};

void sizeRow(Table& table, const char* name, std::size_t bytes,
             std::size_t paths) {
    table.row(
        {name, grouped(bytes) + " B",
         fixed(static_cast<double>(bytes) / static_cast<double>(paths), 2) +
             " B"});
}

// The most that this process had in memory, the list's text included.
std::size_t peakResidentBytes() {
    rusage usage{};
    ::getrusage(RUSAGE_SELF, &usage);
    return static_cast<std::size_t>(usage.ru_maxrss) * 1024;
}

std::string asTable(const Measurements& m) {
    Table table({"", "total", "per path", "paths/s"});
    table.row({"paths", grouped(m.paths)});
    sizeRow(table, "text", m.textBytes, m.paths);
    sizeRow(table, "in memory", m.memory.total(), m.paths);
    sizeRow(table, "- names", m.memory.names, m.paths);
    sizeRow(table, "- tree", m.memory.tree, m.paths);
    sizeRow(table, "- numbers", m.memory.numbers, m.paths);
    sizeRow(table, "- encoding", m.memory.encoding, m.paths);
    sizeRow(table, "- other", m.memory.other, m.paths);
    sizeRow(table, "saved", m.storedBytes, m.paths);
    sizeRow(table, "peak of the process", peakResidentBytes(), m.paths);
    for (const Step& step : m.steps) {
        const auto paths = static_cast<double>(step.paths);
        table.row({step.name, fixed(step.seconds, 3) + " s",
                   fixed(step.seconds * 1e9 / paths, 0) + " ns",
                   grouped(static_cast<std::size_t>(paths / step.seconds))});
    }
    return table.text();
}

}  // namespace

bool runMainJob(const std::string& listOrFolder) {
    MainJob job;
    const auto difference = job.run(listOrFolder);
    if (job.walk.foldersSkipped != 0) {
        std::cout << grouped(job.walk.foldersSkipped)
                  << " folders could not be read, the first of them "
                  << job.walk.firstSkipped << ": " << job.walk.firstReason
                  << ".\n\n";
    }
    std::cout << asTable(job.results) << '\n';
    if (difference) {
        std::cout << *difference << '\n';
        return false;
    }
    std::cout << "all " << job.results.paths << " paths identical\n";
    return true;
}

}  // namespace bench
