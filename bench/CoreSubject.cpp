// The core itself as a subject: UTF-16 texts in, UTF-16 texts out.

#include <array>
#include <map>
#include <utility>

#include "bench/PathReader.hpp"
#include "bench/Subject.hpp"
#include "bench/Timing.hpp"

namespace bench {

using tessel::HuffmanPathTree;
using tessel::paths::Batch;
using tessel::paths::BatchReader;
using tessel::paths::CharacterCounts;
using tessel::paths::PathSplitter;

namespace {

// Long lists come in several batches, so that their texts need not all be in
// memory.
constexpr std::size_t pathsPerBatch = 1'000'000;

CharacterCounts sumOf(const std::map<char16_t, double>& sums) {
    CharacterCounts counts;
    for (const auto& [unit, frequency] : sums) {
        counts.characters.push_back(unit);
        counts.frequencies.push_back(frequency);
    }
    return counts;
}

class CoreSubject : public Subject {
public:
    explicit CoreSubject(const PathSplitter& pathSplitter)
        : splitter_(&pathSplitter) {}

    std::string name() const override { return "core"; }
    std::size_t paths() const override { return splitter_->list().size(); }

    // Counts, makes the code, encodes and inserts; the lists of UTF-16
    // strings are there before. They are released while they are added.
    double build() override {
        Batch batch;
        CharacterCounts counts;
        double seconds = countAll(batch, counts);
        seconds += secondsOf([&] { coder_ = coderFor(std::move(counts)); });
        if (!batch.folders.empty()) return seconds + add(batch);
        BatchReader reader(*splitter_, pathsPerBatch);
        while (reader.next(batch)) seconds += add(batch);
        return seconds;
    }

    double iterate() override {
        return secondsOf([&] {
            bench::iterate(*coder_,
                           [](const std::u16string& text) { keep(text); });
        });
    }

    double fetchAll() override {
        const auto numbers = numbersFrom(1, splitter_->list().size());
        return secondsOf([&] {
            fetch(*coder_, numbers,
                  [](const std::u16string& text) { keep(text); });
        });
    }

    double fetchRandom(const std::vector<std::size_t>& numbers) override {
        return secondsOf([&] {
            for (const std::size_t number : numbers) {
                fetch(*coder_, std::array<std::size_t, 1>{number},
                      [](const std::u16string& text) { keep(text); });
            }
        });
    }

    double store() override {
        form_.clear();
        form_.shrink_to_fit();
        return secondsOf([&] {
            coder_->serialize(form_, true);
            treeString_ = coder_->getTreeString();
        });
    }

    double restore() override {
        return secondsOf([&] {
            restored_ = std::make_unique<HuffmanPathTree>();
            restored_->deserialize(form_, true);
            restored_->inflateHuffman(treeString_);
        });
    }

    double destroyRestored() override {
        return secondsOf([&] { restored_.reset(); });
    }
    double destroy() override {
        return secondsOf([&] { coder_.reset(); });
    }

    std::size_t storedBytes() const override {
        return form_.size() + treeString_.size() * sizeof(char16_t);
    }
    bool verify() override { return isList(*coder_); }
    bool verifyRestored() override { return isList(*restored_); }

private:
    // Leaves the batch in place if it is the only one.
    double countAll(Batch& batch, CharacterCounts& counts) const {
        BatchReader reader(*splitter_, pathsPerBatch);
        std::map<char16_t, double> sums;
        double seconds = 0;
        while (reader.next(batch)) {
            seconds += secondsOf([&] {
                counts =
                    tessel::paths::countCharacters(batch.folders, batch.files);
                for (std::size_t i = 0; i < counts.characters.size(); ++i) {
                    sums[counts.characters[i]] += counts.frequencies[i];
                }
            });
            if (batch.pathCount == splitter_->list().size()) return seconds;
        }
        counts = sumOf(sums);
        return seconds;
    }

    double add(Batch& batch) const {
        return secondsOf([&] {
            coder_->generateCodeAsyncAndAddPaths(batch.folders, batch.files);
        });
    }

    bool isList(HuffmanPathTree& tested) const {
        std::size_t fetched = 0;
        bool same = true;
        fetch(tested, numbersFrom(1, splitter_->list().size()),
              [&](const std::u16string& text) {
                  same = same && isPath(text, fetched++);
              });
        const auto order = iterationOrder(tested, *splitter_);
        std::size_t met = 0;
        bench::iterate(tested, [&](const std::u16string& text) {
            same = same && met < order.size() && isPath(text, order[met]);
            ++met;
        });
        return same && fetched == order.size() && met == order.size();
    }

    bool isPath(const std::u16string& text, std::size_t position) const {
        std::string path;
        return position < splitter_->list().size() &&
               tessel::paths::textToPath(text, path) &&
               path == splitter_->list()[position];
    }

    const PathSplitter* splitter_;
    CoderPtr coder_;
    CoderPtr restored_;
    std::vector<std::uint8_t> form_;
    std::u16string treeString_;
};

}  // namespace

SubjectPtr makeCore(const PathSplitter& splitter) {
    return std::make_unique<CoreSubject>(splitter);
}

}  // namespace bench
