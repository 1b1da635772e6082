#include "hosts/embedded/demo/HostJob.hpp"

#include <malloc.h>

#include <algorithm>
#include <chrono>
#include <limits>
#include <numeric>
#include <utility>

#include "hosts/embedded/FilesetClass.hpp"

namespace tessel::embedded {

namespace {

constexpr std::size_t pathsPerBatch = 20'000;
constexpr std::size_t numbersAtOnce = 50'000;

std::vector<std::u16string> textsOf(const Value& cell) {
    std::vector<std::u16string> texts;
    for (std::size_t i = 0; i < cell.numel(); ++i)
        texts.emplace_back(cell.element(i).charData());
    return texts;
}

// Components with the file's name last, joined.
std::u16string joinedText(std::vector<std::u16string> components) {
    const std::u16string file = std::move(components.back());
    components.pop_back();
    std::u16string text;
    paths::appendFolder(components, text);
    return text + file;
}

std::string toPath(std::u16string_view joined) {
    std::string path;
    if (!paths::textToPath(joined, path)) path = "(the text of no path)";
    return path;
}

void requireCount(std::size_t count, std::size_t wanted,
                  const std::string& route) {
    if (count == wanted) return;
    throw DifferenceException(route + ": " + std::to_string(count) +
                              " paths instead of " + std::to_string(wanted));
}

std::size_t heapBytes() {
    const struct mallinfo2 info = mallinfo2();
    return info.uordblks + info.hblkhd;
}

}  // namespace

HostJob::HostJob(Host& host, const paths::PathList& list)
    : host_(host), list_(list), splitter_(list) {}

JobResults HostJob::run() {
    results_ = {};
    results_.paths = list_.size();
    results_.keptApart = splitter_.keptApartCount();
    results_.textBytes = list_.textBytes();

    const std::size_t heapBefore = heapBytes();
    const Value instance = makeInstance();
    addPaths(instance);
    results_.instanceBytes = heapBytes() - heapBefore;
    readInEveryWay(instance);

    const Value rebuilt = rebuild(instance);
    iterate(rebuilt, "iterate the rebuilt one");
    Value copied;
    step("copy", [&] { copied = host_.copy(rebuilt); });
    host_.destroy(rebuilt);
    fetchJoined(copied, "fetch from the copy");
    Value saved;
    step("save", [&] { saved = host_.save(copied); });
    Value loaded;
    step("load", [&] { loaded = host_.load(filesetClassName, saved); });
    fetchParts(loaded, "fetch from the loaded one");
    return results_;
}

void HostJob::step(const std::string& name,
                   const std::function<void()>& action) {
    using Clock = std::chrono::steady_clock;
    const Clock::time_point begin = Clock::now();
    action();
    const std::chrono::duration<double> taken = Clock::now() - begin;
    results_.steps.push_back({name, taken.count(), list_.size()});
}

// In mode "files": folders first, then as many cells of file names. A list of
// one character alone gets a second one to count, so that there is a code.
Value HostJob::makeInstance() {
    paths::BatchReader reader(splitter_,
                              std::numeric_limits<std::size_t>::max());
    paths::Batch all;
    reader.next(all);
    if (paths::countCharacters(all.folders, all.files).characters.size() == 1)
        all.files.back().push_back({paths::noRoot});
    std::vector<Value> elements;
    elements.reserve(2 * all.folders.size());
    for (const auto& folder : all.folders)
        elements.push_back(Value::texts(folder));
    for (const auto& files : all.files) elements.push_back(Value::texts(files));
    all = {};
    const Value foldersAndFiles = Value::cellColumn(elements);
    Value instance;
    step("make, mode files", [&] {
        instance = host_.construct(filesetClassName, Value::text(u"files"),
                                   foldersAndFiles);
    });
    return instance;
}

void HostJob::addPaths(const Value& instance) {
    step("add, in batches", [&] {
        paths::BatchReader reader(splitter_, pathsPerBatch);
        paths::Batch batch;
        while (reader.next(batch)) {
            host_.call(0, instance, "addPaths", Value::textLists(batch.folders),
                       Value::textLists(batch.files));
        }
    });
}

void HostJob::readInEveryWay(const Value& instance) {
    iterate(instance, "iterate");
    fetchJoined(instance, "fetch, with separator");
    fetchParts(instance, "fetch, in parts");
}

// Through the outputs of serialize and the property Frequencies.
Value HostJob::rebuild(const Value& instance) {
    std::vector<Value> outputs;
    step("serialize", [&] { outputs = host_.call(2, instance, "serialize"); });
    const Value frequencies = host_.get(instance, "Frequencies");
    results_.storedBytes = outputs[1].numel() +
                           outputs[0].numel() * sizeof(char16_t) +
                           frequencies.numel() * sizeof(double);
    Value rebuilt;
    step("rebuild, mode tree", [&] {
        rebuilt = host_.construct(filesetClassName, Value::text(u"tree"),
                                  outputs[0], outputs[1], frequencies);
    });
    return rebuilt;
}

// The order of iteration is the tree's own, so both sides are sorted.
void HostJob::iterate(const Value& instance, const std::string& name) {
    std::vector<std::string> iterated;
    step(name, [&] {
        iterated.clear();
        iterated.reserve(list_.size());
        host_.call(0, instance, "reset");
        while (host_.call(1, instance, "hasNextPath")[0].truth(0)) {
            const Value path = host_.call(1, instance, "getNextPath")[0];
            iterated.push_back(toPath(joinedText(textsOf(path))));
        }
    });
    std::sort(iterated.begin(), iterated.end());
    std::vector<std::size_t> order(list_.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::sort(order.begin(), order.end(), [&](std::size_t a, std::size_t b) {
        return list_[a] < list_[b];
    });
    requireCount(iterated.size(), order.size(), name);
    for (std::size_t i = 0; i < order.size(); ++i) {
        if (iterated[i] == list_[order[i]]) continue;
        throw DifferenceException(name + ": " + std::string(list_[order[i]]) +
                                  "\nis missing before\n" + iterated[i]);
    }
}

void HostJob::fetchJoined(const Value& instance, const std::string& name) {
    const Value separator = Value::text(u"/");
    step(name, [&] {
        forNumbers(name, [&](const Value& numbers, std::size_t first) {
            const Value fetched =
                host_.call(1, instance, "getPaths", numbers, separator)[0];
            for (std::size_t i = 0; i < fetched.numel(); ++i)
                compareInOrder(first + i, fetched.element(i).charData(), name);
            return fetched.numel();
        });
    });
}

void HostJob::fetchParts(const Value& instance, const std::string& name) {
    step(name, [&] {
        forNumbers(name, [&](const Value& numbers, std::size_t first) {
            const std::vector<Value> parts =
                host_.call(2, instance, "getPaths", numbers);
            std::size_t count = 0;
            for (std::size_t i = 0; i < parts[0].numel(); ++i) {
                std::u16string folder;
                paths::appendFolder(textsOf(parts[0].element(i)), folder);
                for (const auto& file : textsOf(parts[1].element(i)))
                    compareInOrder(first + count++, folder + file, name);
            }
            return count;
        });
    });
}

void HostJob::forNumbers(const std::string& route, const Visit& visit) const {
    for (std::size_t first = 1; first <= list_.size(); first += numbersAtOnce) {
        std::vector<double> numbers(
            std::min(numbersAtOnce, list_.size() - first + 1));
        std::iota(numbers.begin(), numbers.end(), static_cast<double>(first));
        const std::size_t asked = numbers.size();
        requireCount(visit(Value::column(std::move(numbers)), first), asked,
                     route);
    }
}

// The path of a number, counted from 1.
void HostJob::compareInOrder(std::size_t number, std::u16string_view joined,
                             const std::string& route) const {
    const std::string path = toPath(joined);
    if (number <= list_.size() && path == list_[number - 1]) return;
    throw DifferenceException(
        route + ": path " + std::to_string(number) + " should be\n" +
        std::string(number <= list_.size() ? list_[number - 1]
                                           : "(after the last)") +
        "\nand is\n" + path);
}

}  // namespace tessel::embedded
