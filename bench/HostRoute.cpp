#include "bench/HostRoute.hpp"

#include <algorithm>
#include <numeric>
#include <string_view>
#include <utility>

#include "bench/Timing.hpp"
#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/Host.hpp"
#include "paths/Batches.hpp"

namespace bench {

using tessel::embedded::filesetClassName;
using tessel::embedded::Host;
using tessel::embedded::HostOptions;
using tessel::embedded::Value;
using tessel::paths::Batch;
using tessel::paths::BatchReader;
using tessel::paths::PathSplitter;

namespace {

// Few enough that the texts of one call, some 200 bytes each, stay in the
// processor's second cache until they are read, and that the host's pool keeps
// their blocks for the next call.
constexpr std::size_t numbersPerCall = 1'000;
constexpr std::size_t pathsPerAddition = 100'000;

HostOptions options() {
    HostOptions options;
    options.messages = QZTESSEL_MESSAGES;
    return options;
}

// Replaces `text` by the joined text of a cell of names, the file's last.
void join(const Value& names, std::u16string& text) {
    text.clear();
    const std::size_t count = names.numel();
    for (std::size_t i = 0; i < count; ++i) {
        text += names.element(i).charData();
        if (i > 0 && i + 1 < count) text += u'/';
    }
}

class HostRoute : public Subject {
public:
    explicit HostRoute(const PathSplitter& splitter)
        : splitter_(splitter), host_(options()) {
        host_.loadModule(QZTESSEL_PLUGIN);
    }

    std::string name() const override { return "through the plug-in"; }
    std::size_t paths() const override { return splitter_.list().size(); }

    // Makes the code and adds the paths; the values are there before.
    double build() override {
        double seconds = makeInstance();
        BatchReader reader(splitter_, pathsPerAddition);
        Batch batch;
        while (reader.next(batch)) {
            const Value folders = Value::textLists(batch.folders);
            const Value files = Value::textLists(batch.files);
            seconds += secondsOf(
                [&] { host_.call(0, instance_, "addPaths", folders, files); });
        }
        return seconds;
    }

    double iterate() override {
        return secondsOf([&] {
            visitAll(instance_, [](const std::u16string& text) { keep(text); });
        });
    }

    double fetchAll() override {
        return secondsOf([&] {
            fetchAll(instance_, [](std::u16string_view text) { keep(text); });
        });
    }

    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        return secondsOf([&] {
            for (const std::size_t number : numbers)
                keep(fetch(instance_, {static_cast<double>(number)})
                         .element(0)
                         .charData());
        });
    }

    double store() override {
        outputs_.clear();
        return secondsOf([&] {
            outputs_ = host_.call(2, instance_, "serialize");
            outputs_.push_back(host_.get(instance_, "Frequencies"));
        });
    }

    double restore() override {
        return secondsOf([&] {
            restored_ = host_.construct(filesetClassName, Value::text(u"tree"),
                                        outputs_[0], outputs_[1], outputs_[2]);
        });
    }

    double destroyRestored() override {
        return secondsOf([&] { restored_ = Value(); });
    }
    double destroy() override {
        return secondsOf([&] { instance_ = Value(); });
    }

    std::size_t storedBytes() const override {
        return outputs_[1].numel() + outputs_[0].numel() * sizeof(char16_t);
    }
    bool verify() override { return isList(instance_); }
    bool verifyRestored() override { return isList(restored_); }

private:
    double makeInstance() {
        BatchReader reader(splitter_, splitter_.list().size());
        Batch all;
        reader.next(all);
        const auto counts =
            tessel::paths::countCharacters(all.folders, all.files);
        all = {};
        const Value characters = Value::text(counts.characters);
        const Value frequencies = Value::column(counts.frequencies);
        return secondsOf([&] {
            instance_ =
                host_.construct(filesetClassName, Value::text(u"frequencies"),
                                characters, frequencies);
        });
    }

    template <class Visit>
    void visitAll(const Value& instance, Visit visit) {
        std::u16string text;
        host_.call(0, instance, "reset");
        while (host_.call(1, instance, "hasNextPath")[0].truth(0)) {
            join(host_.call(1, instance, "getNextPath")[0], text);
            visit(static_cast<const std::u16string&>(text));
        }
    }

    Value fetch(const Value& instance, std::vector<double> numbers) {
        return std::move(host_.call(1, instance, "getPaths",
                                    Value::column(std::move(numbers)),
                                    separator_)[0]);
    }

    template <class Visit>
    void fetchAll(const Value& instance, Visit visit) {
        const std::size_t last = paths();
        for (std::size_t first = 1; first <= last; first += numbersPerCall) {
            std::vector<double> numbers(
                std::min(numbersPerCall, last - first + 1));
            std::iota(numbers.begin(), numbers.end(),
                      static_cast<double>(first));
            const Value cell = fetch(instance, std::move(numbers));
            for (std::size_t i = 0; i < cell.numel(); ++i)
                visit(cell.element(i).charData());
        }
    }

    // That fetching gives the list, and that iteration gives as many paths.
    bool isList(const Value& instance) {
        std::size_t fetched = 0;
        bool same = true;
        fetchAll(instance, [&](std::u16string_view text) {
            same = same && isPath(text, fetched++);
        });
        std::size_t met = 0;
        visitAll(instance, [&](const std::u16string&) { ++met; });
        return same && fetched == paths() && met == paths();
    }

    bool isPath(std::u16string_view text, std::size_t position) const {
        std::string path;
        return position < paths() && tessel::paths::textToPath(text, path) &&
               path == splitter_.list()[position];
    }

    const PathSplitter& splitter_;
    Host host_;
    const Value separator_ = Value::text(u"/");
    Value instance_;
    Value restored_;
    std::vector<Value> outputs_;
};

}  // namespace

SubjectPtr makeHostRoute(const PathSplitter& splitter) {
    return std::make_unique<HostRoute>(splitter);
}

}  // namespace bench
