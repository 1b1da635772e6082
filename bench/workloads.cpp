// Small fixed workloads whose instructions bench/regress counts. Each
// makes its own input, which is not counted, and runs on one thread.

#include <valgrind/callgrind.h>

#include <array>
#include <cstdint>
#include <exception>
#include <functional>
#include <iostream>
#include <string>
#include <string_view>
#include <utility>

#include "archive/PathArchive.hpp"
#include "bench/PathReader.hpp"
#include "bench/Timing.hpp"

namespace {

using bench::CoderPtr;
using tessel::HuffmanPathTree;
using tessel::paths::Batch;
using tessel::paths::BatchReader;
using tessel::paths::PathList;
using tessel::paths::PathSplitter;

constexpr std::size_t pathCount = 40'000;
constexpr std::size_t randomFetches = 10'000;

// Numbers that are the same on every machine.
class Numbers {
public:
    std::size_t below(std::size_t bound) {
        state_ = state_ * 6364136223846793005U + 1442695040888963407U;
        return static_cast<std::size_t>(state_ >> 33U) % bound;
    }

private:
    std::uint64_t state_ = 20230610;
};

std::string name(Numbers& numbers, std::size_t syllables) {
    constexpr std::array<const char*, 16> parts = {
        "lib", "con", "fig", "data", "test", "in", "de", "x",
        "ma",  "nu",  "al",  "re",   "port", "er", "_",  "-"};
    std::string text;
    for (std::size_t i = 0; i < syllables; ++i) {
        text += parts[numbers.below(parts.size())];
    }
    return text;
}

// Folders of one to forty files, up to five deep.
PathList madeUpList() {
    Numbers numbers;
    PathList list;
    std::string folder = "usr";
    while (list.size() < pathCount) {
        const std::size_t depth = numbers.below(5);
        std::size_t end = folder.find('/');
        for (std::size_t i = 0; i < depth && end < folder.size(); ++i) {
            end = folder.find('/', end + 1);
        }
        folder.resize(std::min(end, folder.size()));
        folder += '/' + name(numbers, 2 + numbers.below(2));
        const std::size_t files = 1 + numbers.below(40);
        for (std::size_t i = 0; i < files && list.size() < pathCount; ++i) {
            list.append(folder + '/' + name(numbers, 3 + numbers.below(4)) +
                        ".html");
        }
    }
    return list;
}

PathList shuffled(const PathList& list) {
    Numbers numbers;
    std::vector<std::size_t> order(list.size());
    for (std::size_t i = 0; i < order.size(); ++i) {
        order[i] = i;
        std::swap(order[i], order[numbers.below(i + 1)]);
    }
    PathList result;
    for (const std::size_t i : order) result.append(list[i]);
    return result;
}

Batch batchOf(const PathList& list) {
    const PathSplitter splitter(list);
    Batch batch;
    BatchReader(splitter, list.size()).next(batch);
    return batch;
}

CoderPtr built(Batch batch) {
    CoderPtr coder = bench::coderFor(
        tessel::paths::countCharacters(batch.folders, batch.files));
    coder->generateCodeAsyncAndAddPaths(batch.folders, batch.files, 1);
    return coder;
}

CoderPtr usualCoder() { return built(batchOf(madeUpList())); }

// Counts the instructions of a call, on all threads.
template <class Call>
void count(Call call) {
    CALLGRIND_START_INSTRUMENTATION;
    call();
    CALLGRIND_STOP_INSTRUMENTATION;
}

void build(const PathList& list) {
    Batch batch = batchOf(list);
    count([&] { built(std::move(batch)); });
}

void iterateAll() {
    const CoderPtr coder = usualCoder();
    count([&] {
        bench::iterate(*coder,
                       [](const std::u16string& text) { bench::keep(text); });
    });
}

void fetchAll() {
    const CoderPtr coder = usualCoder();
    const auto numbers = bench::numbersFrom(1, coder->pathCount);
    count([&] {
        bench::fetch(*coder, numbers,
                     [](const std::u16string& text) { bench::keep(text); });
    });
}

void fetchRandom() {
    const CoderPtr coder = usualCoder();
    Numbers numbers;
    count([&] {
        for (std::size_t i = 0; i < randomFetches; ++i) {
            const auto number = 1 + numbers.below(coder->pathCount);
            bench::fetch(*coder, std::array<std::size_t, 1>{number},
                         [](const std::u16string& text) { bench::keep(text); });
        }
    });
}

// Without zlib, which would outweigh all else.
void storeAndRestore() {
    const CoderPtr coder = usualCoder();
    count([&] {
        std::vector<std::uint8_t> form;
        coder->serialize(form, false);
        HuffmanPathTree restored;
        restored.deserialize(form, false);
        restored.inflateHuffman(coder->getTreeString());
    });
}

// ---- The archive, on one thread and in memory ----

std::vector<std::uint8_t> archiveOf(const PathList& list) {
    tessel::ArchiveOptions options;
    options.threads = 1;
    std::vector<std::uint8_t> bytes;
    tessel::ArchiveWriter writer(bytes, options);
    for (std::size_t i = 0; i < list.size(); ++i) writer.add(list[i]);
    writer.finish();
    return bytes;
}

void buildArchive() {
    const PathList list = madeUpList();
    count([&] { bench::keep(archiveOf(list)); });
}

// Counts what a call does with a newly opened archive, so that the checks at
// the first touch of each piece are counted, too.
template <class Call>
void countOnArchive(Call call) {
    const auto bytes = archiveOf(madeUpList());
    const auto archive = tessel::PathArchive::over(bytes);
    count([&] { call(archive); });
}

void getFromArchive(const tessel::PathArchive& archive) {
    Numbers numbers;
    std::string path;
    for (std::size_t i = 0; i < randomFetches; ++i) {
        archive.read(numbers.below(archive.size()), path);
        bench::keep(path);
    }
}

void iterateArchive(const tessel::PathArchive& archive) {
    archive.forEach(
        [](std::uint64_t, std::string_view path) { bench::keep(path); });
}

void findInArchive(const tessel::PathArchive& archive) {
    tessel::FindOptions options;
    options.threads = 1;
    bench::keep(archive.find("confignu", options));
}

using Workload = std::pair<std::string_view, std::function<void()>>;

const std::array<Workload, 10>& workloads() {
    static const std::array<Workload, 10> all = {{
        {"build-sorted", [] { build(madeUpList()); }},
        {"build-shuffled", [] { build(shuffled(madeUpList())); }},
        {"iterate", iterateAll},
        {"fetch-all", fetchAll},
        {"fetch-random", fetchRandom},
        {"store-and-restore", storeAndRestore},
        {"archive-build", buildArchive},
        {"archive-get", [] { countOnArchive(getFromArchive); }},
        {"archive-iterate", [] { countOnArchive(iterateArchive); }},
        {"archive-find", [] { countOnArchive(findInArchive); }},
    }};
    return all;
}

// Runs the workload of that name. Without a name, prints all names.
int run(std::string_view wanted) {
    for (const auto& [workload, body] : workloads()) {
        if (wanted.empty()) std::cout << workload << '\n';
        if (workload != wanted) continue;
        body();
        return 0;
    }
    if (wanted.empty()) return 0;
    std::cerr << "workloads: there is no " << wanted << '\n';
    return 2;
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return run(argc > 1 ? argv[1] : "");
    } catch (const std::exception& error) {
        std::cerr << "workloads: " << error.what() << '\n';
        return 1;
    }
}
