#include "bench/Comparison.hpp"

#include <algorithm>
#include <fstream>
#include <iostream>
#include <stdexcept>

#include "bench/CoreBounds.hpp"
#include "bench/Series.hpp"
#include "bench/Timing.hpp"

namespace bench {

using tessel::paths::PathList;
using tessel::paths::PathSplitter;

namespace {

constexpr std::array<Operation, operationCount> operations = {
    Operation::Build,       Operation::Iterate,    Operation::FetchAll,
    Operation::FetchRandom, Operation::FindNumber, Operation::Store,
    Operation::Restore,     Operation::Destroy};

PathList readList(const std::string& name) {
    tessel::paths::WalkReport report;
    return tessel::paths::readPaths(name, report);
}

// Where the list comes from, if the file beside it says so.
std::string originOf(const std::string& list) {
    const std::size_t slash = list.rfind('/');
    const std::string folder =
        slash == std::string::npos ? "" : list.substr(0, slash + 1);
    std::ifstream file(folder + "origin.txt");
    std::string origin;
    std::getline(file, origin);
    return origin.empty() ? list : origin;
}

std::string shortName(const std::string& list) {
    return list.substr(list.rfind('/') + 1);
}

// What every output says first.
void describe(const PathList& list, const std::string& name) {
    std::cout << shortName(name) << ": " << grouped(list.size()) << " paths, "
              << fixed(static_cast<double>(list.textBytes()) /
                           static_cast<double>(list.size()),
                       2)
              << " bytes per path, from " << originOf(name) << ".\n\n";
    for (const auto& [fact, value] : machineFacts()) {
        std::cout << "- " << fact << ": " << value << '\n';
    }
    std::cout << '\n';
}

Json describeJson(const PathList& list, const std::string& name) {
    Json json;
    json.text("list", shortName(name))
        .text("origin", originOf(name))
        .number("paths", static_cast<double>(list.size()))
        .number("textBytes", static_cast<double>(list.textBytes()));
    return json;
}

void finish(const Options& options, const Json& json) {
    if (!options.jsonFile.empty()) writeJson(options.jsonFile, json);
}

// A row of one figure for every subject, and after each but the first how many
// times the first's it is.
void ratioRow(Table& table, std::string what, const std::vector<double>& values,
              const std::vector<double>& ratios) {
    std::vector<std::string> cells = {std::move(what)};
    for (std::size_t i = 0; i < values.size(); ++i) {
        cells.push_back(threeDigits(values[i]));
        if (i > 0) cells.push_back(threeDigits(ratios[i]));
    }
    table.row(std::move(cells));
}

template <class Value>
void valueRow(Table& table, std::string what, const std::vector<Series>& all,
              Value value) {
    std::vector<double> values;
    std::vector<double> ratios;
    for (const Series& one : all) {
        values.push_back(value(one));
        ratios.push_back(values.back() / values.front());
    }
    ratioRow(table, std::move(what), values, ratios);
}

std::string rivalsTable(const std::vector<Series>& all) {
    std::vector<std::string> heads = {"per path"};
    for (const Series& one : all) {
        heads.push_back(one.name);
        if (&one != &all.front()) heads.emplace_back("ratio");
    }
    Table table(heads);
    valueRow(table, "bytes in memory", all,
             [](const Series& s) { return s.memoryPerPath(); });
    valueRow(table, "bytes stored", all,
             [](const Series& s) { return s.storedPerPath(); });
    for (const Operation operation : operations) {
        std::vector<double> values;
        std::vector<double> ratios;
        for (const Series& one : all) {
            values.push_back(one.nanoseconds(operation));
            ratios.push_back(one.times(all.front(), operation));
        }
        ratioRow(table, std::string("ns to ") + nameOf(operation), values,
                 ratios);
    }
    return table.text();
}

std::string compressorsTable(const std::vector<Compressed>& all,
                             const Series& first, std::size_t paths) {
    const auto count = static_cast<double>(paths);
    Table table({"the whole text", "bytes per path", "ratio", "ns to store",
                 "ns to restore"});
    table.row({first.name, threeDigits(first.storedPerPath()), "",
               threeDigits(first.nanoseconds(Operation::Store)),
               threeDigits(first.nanoseconds(Operation::Restore))});
    for (const Compressed& one : all) {
        const double bytes = static_cast<double>(one.bytes) / count;
        table.row({one.name, threeDigits(bytes),
                   threeDigits(bytes / first.storedPerPath()),
                   threeDigits(one.storeSeconds * 1e9 / count),
                   threeDigits(one.restoreSeconds * 1e9 / count)});
    }
    return table.text();
}

std::string boundsTable(const CoreBounds& m) {
    const auto instance = static_cast<double>(m.instanceBytes);
    const auto times = [&](double value, double of) {
        return threeDigits(value / of);
    };
    Table table({"the library beside its own bounds", "figure"});
    table.row({"instance / UTF-8 text",
               times(instance, static_cast<double>(m.textBytes))});
    table.row({"memoryUsage / allocator's figure",
               times(static_cast<double>(m.usageBytes), instance)});
    table.row({"restored instance / instance",
               times(static_cast<double>(m.restoredBytes), instance)});
    table.row({"peak while adding, beyond the inputs / instance",
               times(static_cast<double>(m.addingPeak), instance)});
    table.row({"peak while restoring, beyond the form / instance",
               times(static_cast<double>(m.restoringPeak), instance)});
    table.row({"serialize / compress2", threeDigits(m.serializeToCompress)});
    table.row({"restore / uncompress", threeDigits(m.restoreToUncompress)});
    table.row({"destroy / build", threeDigits(m.destroyToBuild)});
    table.row({"encoding with 1 worker / with 2", threeDigits(m.twoWorkers)});
    return table.text();
}

Json seriesJson(const std::vector<Series>& all) {
    Json json;
    std::vector<Json> subjects;
    for (const Series& one : all) {
        Json subject = one.json();
        Json ratios;
        for (const Operation operation : operations) {
            if (one.of(operation).empty()) continue;
            ratios.number(keyOf(operation), one.times(all.front(), operation));
        }
        subject.object("timesTheFirsts", ratios);
        subjects.push_back(subject);
    }
    json.list("subjects", subjects);
    return json;
}

// Adds a subject, if this program was built with it.
void addTo(std::vector<SubjectPtr>& subjects, SubjectPtr subject) {
    if (subject != nullptr) subjects.push_back(std::move(subject));
}

std::vector<SubjectPtr> allSubjects(const PathSplitter& splitter,
                                    const Options& options) {
    const PathList& list = splitter.list();
    std::vector<SubjectPtr> subjects;
    addTo(subjects, makeStore(list));
    addTo(subjects, makeCore(splitter));
    if (options.host) addTo(subjects, options.host(splitter));
    addTo(subjects, makeArchive(list));
    addTo(subjects, makeMarisa(list));
    addTo(subjects, makeTextVector(list));
    addTo(subjects, makeStringVector(list));
    addTo(subjects, makeTextBuffer(list));
    return subjects;
}

constexpr std::size_t yardstickPaths = 70'000;

PathList headOf(const PathList& list, std::size_t count) {
    PathList head;
    for (std::size_t i = 0; i < count; ++i) head.append(list[i]);
    return head;
}

// Short lists are measured more often, as their times vary more, unless one
// run is all that is wanted.
Plan planFor(std::size_t paths, int runs) {
    Plan plan;
    const auto more = static_cast<int>(std::min<std::size_t>(
        40, std::size_t{500'000} / std::max<std::size_t>(paths, 1)));
    plan.runs = runs == 1 ? 1 : std::max(runs, more);
    // A run on the longest lists takes a minute, most of it rivals' building.
    if (paths > 1'000'000) plan.runs = std::min(runs, 3);
    plan.storeRuns = paths > 300'000 ? 1 : plan.runs;
    return plan;
}

std::vector<std::string> figureHeads(std::string first) {
    std::vector<std::string> heads = {std::move(first), "bytes in memory",
                                      "bytes stored"};
    for (const Operation operation : operations) {
        heads.push_back(std::string("ns to ") + nameOf(operation));
    }
    return heads;
}

std::vector<std::string> figures(std::string first, const Series& one) {
    std::vector<std::string> cells = {std::move(first),
                                      threeDigits(one.memoryPerPath()),
                                      threeDigits(one.storedPerPath())};
    for (const Operation operation : operations) {
        cells.push_back(threeDigits(one.nanoseconds(operation)));
    }
    return cells;
}

}  // namespace

void compareRivals(const std::string& listName, const Options& options) {
    const PathList list = readList(listName);
    const PathSplitter splitter(list);
    describe(list, listName);

    Plan plan;
    plan.runs = options.runs;
    plan.storeRuns = std::min(options.runs, 2);
    auto subjects = allSubjects(splitter, options);
    const auto all = measure(subjects, plan);
    std::cout << rivalsTable(all) << '\n' << std::flush;
    const CoreBounds bounds = measureCoreBounds(splitter, options.runs);
    std::cout << boundsTable(bounds) << '\n' << std::flush;
    std::vector<Compressed> compressed;
    if (options.compressors) compressed = compressText(list);
    if (!compressed.empty())
        std::cout << compressorsTable(compressed, all.front(), list.size());

    Json json = describeJson(list, listName);
    json.object("rivals", seriesJson(all)).object("bounds", bounds.json());
    std::vector<Json> sizes;
    sizes.reserve(compressed.size());
    for (const Compressed& one : compressed) {
        sizes.push_back(
            Json()
                .text("name", one.name)
                .number("storedBytes", static_cast<double>(one.bytes)));
    }
    json.list("compressors", sizes);
    finish(options, json);
}

void measureGrowth(const std::string& listName, const Options& options) {
    const PathList whole = readList(listName);
    describe(whole, listName);
    // Measured beside every longer list, for ratios within a run.
    const PathList yardstick =
        headOf(whole, std::min(whole.size(), yardstickPaths));
    Table table(figureHeads("paths, subject"));
    std::vector<Json> points;
    for (const std::size_t wanted :
         {std::size_t{1'000}, std::size_t{7'000}, yardstickPaths,
          std::size_t{300'000}, std::size_t{1'000'000}, std::size_t{3'000'000},
          std::size_t{7'000'000}}) {
        if (wanted > whole.size()) break;
        const PathList list = headOf(whole, wanted);
        std::vector<SubjectPtr> subjects;
        addTo(subjects, makeStore(list));
        addTo(subjects, makeArchive(list));
        addTo(subjects, makeMarisa(list));
        addTo(subjects, makeStringVector(list));
        if (wanted > yardstick.size()) {
            addTo(subjects, makeStore(yardstick));
            addTo(subjects, makeArchive(yardstick));
        }
        auto all = measure(subjects, planFor(wanted, options.runs));
        for (Series& one : all) {
            if (one.paths != wanted) one.name = "(70,000 " + one.name + ")";
            table.row(figures(grouped(wanted) + " " + one.name, one));
        }
        std::cerr << grouped(wanted) << " paths measured\n";
        points.push_back(
            seriesJson(all)
                .number("paths", static_cast<double>(wanted))
                .number("textBytes", static_cast<double>(list.textBytes())));
    }
    std::cout << table.text();
    finish(options, describeJson(whole, listName).list("growth", points));
}

void compareOrder(const std::string& sortedName,
                  const std::string& shuffledName, const Options& options) {
    const PathList sorted = readList(sortedName);
    const PathList shuffled = readList(shuffledName);
    if (sorted.size() != shuffled.size()) {
        throw std::runtime_error(shuffledName + " is another list than " +
                                 sortedName + ".");
    }
    describe(sorted, sortedName);
    std::vector<SubjectPtr> subjects;
    std::vector<std::string> names;
    const auto add = [&](SubjectPtr subject, const char* order) {
        if (subject == nullptr) return;
        names.push_back(subject->name() + order);
        subjects.push_back(std::move(subject));
    };
    add(makeStore(sorted), ", sorted");
    add(makeStore(shuffled), ", shuffled");
    add(makeArchive(sorted), ", sorted");
    add(makeArchive(shuffled), ", shuffled");
    add(makeArchive(shuffled, ArchiveKind::Indexed), ", shuffled");
    add(makeMarisa(shuffled), "");
    Plan plan = planFor(sorted.size(), options.runs);
    auto all = measure(subjects, plan);
    for (std::size_t i = 0; i < all.size(); ++i) all[i].name = names[i];
    std::cout << rivalsTable(all);
    Json json = describeJson(sorted, sortedName);
    finish(options, json.object("order", seriesJson(all)));
}

namespace {

PathList siblings(std::size_t folders) {
    PathList list;
    for (std::size_t i = 0; i < folders; ++i) {
        list.append("/data/folder" + std::to_string(i) + "/file");
    }
    return list;
}

PathList oneFolder(std::size_t files) {
    PathList list;
    for (std::size_t i = 0; i < files; ++i) {
        list.append("/data/images/file" + std::to_string(i) + ".png");
    }
    return list;
}

// Chains of folders, each of them with a file in every folder.
PathList chains(std::size_t count, std::size_t depth) {
    PathList list;
    for (std::size_t i = 0; i < count; ++i) {
        std::string folder = "/deep" + std::to_string(i);
        for (std::size_t level = 0; level < depth; ++level) {
            folder += "/d" + std::to_string(level);
            list.append(folder + "/file");
        }
    }
    return list;
}

}  // namespace

void measureShapes(const Options& options) {
    struct Shape {
        const char* key;
        std::string name;
        PathList list;
    };
    // Shapes of one group are compared, so they are measured together.
    std::vector<std::vector<Shape>> groups(3);
    groups[0].push_back(
        {"fewSiblings", "2,000 sibling folders", siblings(2'000)});
    groups[0].push_back(
        {"manySiblings", "200,000 sibling folders", siblings(200'000)});
    groups[1].push_back(
        {"oneFolder", "5,000,000 files in a folder", oneFolder(5'000'000)});
    groups[2].push_back(
        {"chains", "500 chains of 200 folders", chains(500, 200)});
    Table table(figureHeads("per path of"));
    Json all;
    for (const auto& group : groups) {
        std::vector<SubjectPtr> subjects;
        subjects.reserve(group.size());
        for (const Shape& shape : group) {
            addTo(subjects, makeStore(shape.list));
        }
        const auto series =
            measure(subjects, planFor(group.back().list.size(), options.runs));
        for (std::size_t i = 0; i < group.size(); ++i) {
            table.row(figures(group[i].name, series[i]));
            all.object(group[i].key, series[i].json());
            std::cerr << group[i].name << " measured\n";
        }
    }
    std::cout << table.text();
    finish(options, Json().object("shapes", all));
}

}  // namespace bench
