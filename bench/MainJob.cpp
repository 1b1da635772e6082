#include "bench/MainJob.hpp"

#include <sys/resource.h>

#include <algorithm>
#include <iostream>
#include <optional>
#include <utility>

#include "bench/CoderJob.hpp"
#include "bench/Report.hpp"
#include "bench/Timing.hpp"

namespace bench {

using tessel::HuffmanPathTree;
using tessel::paths::Batch;
using tessel::paths::BatchReader;
using tessel::paths::PathList;
using tessel::paths::PathSplitter;

namespace {

constexpr std::size_t randomFetches = 100'000;
constexpr std::size_t comparedAtOnce = 500'000;

struct Step {
    const char* name;
    double seconds;
    std::size_t paths;
};

struct Measurements {
    std::size_t paths = 0;
    std::size_t textBytes = 0;
    std::size_t keptApart = 0;
    HuffmanPathTree::MemoryUsage memory;
    std::size_t storedBytes = 0;
    std::vector<Step> steps;
};

// Compares texts that come one by one with those of the list.
class Comparison {
public:
    // So many texts should come in all.
    Comparison(const PathList& paths, std::size_t texts,
               std::string nameOfRoute)
        : list_(&paths), wanted_(texts), route_(std::move(nameOfRoute)) {}

    // The next text should be that of path `position`, counted from 0.
    void expect(std::size_t position, const std::u16string& joined) {
        ++count_;
        if (difference_) return;
        path_.clear();
        if (!tessel::paths::textToPath(joined, path_)) {
            path_ = "(no path's text)";
        } else if (position < list_->size() && path_ == (*list_)[position]) {
            return;
        }
        difference_ =
            route_ + ": path " + std::to_string(position + 1) +
            " should be\n  " +
            (position < list_->size() ? std::string((*list_)[position])
                                      : "(behind the last)") +
            "\nand is\n  " + path_;
    }

    // The first difference, which may be in the number of texts.
    std::optional<std::string> result() const {
        if (difference_ || count_ == wanted_) return difference_;
        return route_ + ": " + std::to_string(count_) + " paths instead of " +
               std::to_string(wanted_);
    }

private:
    const PathList* list_;
    std::size_t wanted_;
    std::string route_;
    std::size_t count_ = 0;
    std::string path_;
    std::optional<std::string> difference_;
};

// The job, step by step. Each step is timed under its name.
class MainJob {
public:
    std::optional<std::string> run(const std::string& listOrFolder) {
        read(listOrFolder);
        const PathSplitter splitter = split();
        CoderPtr coder = code(splitter);
        add(splitter, *coder);
        results.memory = coder->memoryUsage();
        const auto restored = throughForm(std::move(coder));
        iterateAll(*restored);
        fetchRandom(*restored);
        return compare(*restored, splitter);
    }

    Measurements results;
    tessel::paths::WalkReport walk;

private:
    template <class Call>
    void step(const char* name, std::size_t paths, Call call) {
        results.steps.push_back({name, secondsOf(call), paths});
    }

    void read(const std::string& listOrFolder) {
        const Stopwatch watch;
        list_ = tessel::paths::readPaths(listOrFolder, walk);
        results.paths = list_.size();
        results.textBytes = list_.textBytes();
        results.steps.push_back({"read", watch.seconds(), list_.size()});
    }

    // Where each path is cut; the texts are made batch by batch.
    PathSplitter split() {
        const Stopwatch watch;
        PathSplitter splitter(list_);
        splitSeconds_ = watch.seconds();
        results.keptApart = splitter.keptApartCount();
        return splitter;
    }

    CoderPtr code(const PathSplitter& splitter) {
        tessel::paths::CharacterCounts counts;
        step("count", list_.size(),
             [&] { counts = tessel::paths::countCharacters(splitter); });
        CoderPtr coder;
        step("code", list_.size(),
             [&] { coder = coderFor(std::move(counts)); });
        return coder;
    }

    void add(const PathSplitter& splitter, HuffmanPathTree& coder) {
        double addSeconds = 0;
        BatchReader reader(splitter);
        Batch batch;
        for (;;) {
            const Stopwatch watch;
            const bool more = reader.next(batch);
            splitSeconds_ += watch.seconds();
            if (!more) break;
            addSeconds += secondsOf([&] {
                coder.generateCodeAsyncAndAddPaths(batch.folders, batch.files);
            });
        }
        results.steps.insert(results.steps.begin() + 1,
                             {"split", splitSeconds_, list_.size()});
        results.steps.push_back({"add", addSeconds, list_.size()});
    }

    // Serializes the coder, releases it, and restores another one.
    CoderPtr throughForm(CoderPtr coder) {
        std::vector<std::uint8_t> form;
        step("serialize", list_.size(), [&] { coder->serialize(form, true); });
        results.storedBytes =
            form.size() + coder->treeString.size() * sizeof(char16_t);
        const std::u16string treeString = coder->getTreeString();
        coder.reset();
        auto restored = std::make_unique<HuffmanPathTree>();
        step("restore", list_.size(), [&] {
            restored->deserialize(form, true);
            restored->inflateHuffman(treeString);
        });
        return restored;
    }

    void iterateAll(HuffmanPathTree& coder) {
        step("iterate all", list_.size(), [&] {
            iterate(coder, [](const std::u16string& text) { keep(text); });
        });
    }

    void fetchRandom(const HuffmanPathTree& coder) {
        const auto numbers = randomNumbers(randomFetches, list_.size());
        step("random getPath", numbers.size(), [&] {
            for (const double number : numbers) {
                fetch(coder, {number},
                      [](const std::u16string& text) { keep(text); });
            }
        });
    }

    std::optional<std::string> compare(HuffmanPathTree& coder,
                                       const PathSplitter& splitter) {
        std::optional<std::string> difference;
        step("compare", 2 * list_.size() + randomFetches, [&] {
            difference = compareByNumber(coder);
            if (!difference) difference = compareRandom(coder);
            if (!difference) difference = compareIteration(coder, splitter);
        });
        return difference;
    }

    std::optional<std::string> compareByNumber(const HuffmanPathTree& coder) {
        Comparison comparison(list_, list_.size(), "by number");
        for (std::size_t first = 0; first < list_.size();) {
            const std::size_t end =
                std::min(list_.size(), first + comparedAtOnce);
            fetch(coder, numbersFrom(first + 1, end),
                  [&](const std::u16string& text) {
                      comparison.expect(first++, text);
                  });
            if (first != end) break;
        }
        return comparison.result();
    }

    std::optional<std::string> compareRandom(const HuffmanPathTree& coder) {
        Comparison comparison(list_, randomFetches, "random getPath");
        for (const double number : randomNumbers(randomFetches, list_.size())) {
            fetch(coder, {number}, [&](const std::u16string& text) {
                comparison.expect(static_cast<std::size_t>(number) - 1, text);
            });
        }
        return comparison.result();
    }

    std::optional<std::string> compareIteration(HuffmanPathTree& coder,
                                                const PathSplitter& splitter) {
        Comparison comparison(list_, list_.size(), "iterated");
        const auto order = iterationOrder(coder, splitter);
        std::size_t i = 0;
        iterate(coder, [&](const std::u16string& text) {
            comparison.expect(i < order.size() ? order[i] : list_.size(), text);
            ++i;
        });
        return comparison.result();
    }

    PathList list_;
    double splitSeconds_ = 0;
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
    Table table({"", "total", "a path", "paths/s"});
    table.row({"paths", grouped(m.paths)});
    table.row({"cut in another place", grouped(m.keptApart)});
    sizeRow(table, "text", m.textBytes, m.paths);
    sizeRow(table, "in memory", m.memory.total(), m.paths);
    sizeRow(table, "- names", m.memory.names, m.paths);
    sizeRow(table, "- nodes", m.memory.nodes, m.paths);
    sizeRow(table, "- child lists", m.memory.childLists, m.paths);
    sizeRow(table, "- partition tracks", m.memory.partitionTracks, m.paths);
    sizeRow(table, "- duplicates", m.memory.duplicates, m.paths);
    sizeRow(table, "- code", m.memory.code, m.paths);
    sizeRow(table, "- other", m.memory.other, m.paths);
    sizeRow(table, "stored", m.storedBytes, m.paths);
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
