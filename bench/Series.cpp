#include "bench/Series.hpp"

#include <algorithm>
#include <cmath>
#include <functional>
#include <stdexcept>

#include "bench/Heap.hpp"
#include "bench/PathReader.hpp"
#include "bench/Timing.hpp"

namespace bench {

namespace {

void require(bool verified, const Subject& subject) {
    if (!verified) {
        throw std::runtime_error(subject.name() +
                                 " does not give its paths back.");
    }
}

// One measurement of several subjects.
class Measurement {
public:
    Measurement(std::vector<SubjectPtr>& measured, const Plan& plannedRuns)
        : subjects_(&measured), plan_(plannedRuns) {
        for (const SubjectPtr& subject : measured) {
            Series& one = series_.emplace_back();
            one.name = subject->name();
            one.paths = subject->paths();
            one.fetches = plan_.fetches;
        }
    }

    std::vector<Series> result() {
        for (int i = 0; i < plan_.runs; ++i) run(i == 0, i < plan_.storeRuns);
        return std::move(series_);
    }

private:
    void each(Operation operation,
              const std::function<double(Subject&)>& measured) {
        for (std::size_t i = 0; i < subjects_->size(); ++i) {
            series_[i].seconds[static_cast<std::size_t>(operation)].push_back(
                measured(*(*subjects_)[i]));
        }
    }

    void run(bool isFirst, bool stores) {
        buildAll(isFirst);
        if (isFirst) {
            for (const auto& subject : *subjects_) {
                require(subject->verify(), *subject);
            }
        }
        each(Operation::Iterate, [](Subject& s) { return s.iterate(); });
        each(Operation::FetchAll, [](Subject& s) { return s.fetchAll(); });
        each(Operation::FetchRandom, [&](Subject& s) {
            return s.fetchRandom(randomNumbers(plan_.fetches, s.paths()));
        });
        findAll();
        if (stores) storeAll(isFirst);
        each(Operation::Destroy, [](Subject& s) { return s.destroy(); });
    }

    void buildAll(bool isFirst) {
        std::size_t i = 0;
        each(Operation::Build, [&](Subject& s) {
            const std::size_t before = heapInUse() - s.sideBytes();
            const double seconds = s.build();
            if (isFirst) {
                series_[i].memoryBytes = heapInUse() - s.sideBytes() - before;
            }
            ++i;
            return seconds;
        });
    }

    void findAll() {
        for (std::size_t i = 0; i < subjects_->size(); ++i) {
            Subject& subject = *(*subjects_)[i];
            const auto seconds = subject.findNumbers(
                randomNumbers(plan_.fetches, subject.paths()));
            if (!seconds) continue;
            series_[i]
                .seconds[static_cast<std::size_t>(Operation::FindNumber)]
                .push_back(*seconds);
        }
    }

    void storeAll(bool isFirst) {
        each(Operation::Store, [](Subject& s) { return s.store(); });
        each(Operation::Restore, [&](Subject& s) {
            const double seconds = s.restore();
            if (isFirst) require(s.verifyRestored(), s);
            s.destroyRestored();
            return seconds;
        });
        for (std::size_t i = 0; i < subjects_->size(); ++i) {
            series_[i].storedBytes = (*subjects_)[i]->storedBytes();
        }
    }

    std::vector<SubjectPtr>* subjects_;
    Plan plan_;
    std::vector<Series> series_;
};

}  // namespace

const char* nameOf(Operation operation) {
    constexpr std::array<const char*, operationCount> names = {
        "build",       "iterate", "bulk fetch", "random fetch",
        "find number", "store",   "restore",    "destroy"};
    return names[static_cast<std::size_t>(operation)];
}

const char* keyOf(Operation operation) {
    constexpr std::array<const char*, operationCount> keys = {
        "build",      "iterate", "bulkFetch", "randomFetch",
        "findNumber", "store",   "restore",   "destroy"};
    return keys[static_cast<std::size_t>(operation)];
}

std::vector<double> Series::runs(Operation operation) const {
    const bool isRandom = operation == Operation::FetchRandom ||
                          operation == Operation::FindNumber;
    const std::size_t count = isRandom ? fetches : paths;
    std::vector<double> nanoseconds = of(operation);
    for (double& value : nanoseconds) {
        value *= 1e9 / static_cast<double>(count);
    }
    return nanoseconds;
}

double Series::nanoseconds(Operation operation) const {
    if (of(operation).empty()) return std::nan("");
    return median(runs(operation));
}

double Series::times(const Series& other, Operation operation) const {
    if (of(operation).empty() || other.of(operation).empty())
        return std::nan("");
    return medianRatio(runs(operation), other.runs(operation));
}

double Series::memoryPerPath() const {
    return static_cast<double>(memoryBytes) / static_cast<double>(paths);
}

double Series::storedPerPath() const {
    return static_cast<double>(storedBytes) / static_cast<double>(paths);
}

Json Series::json() const {
    Json all;
    all.text("name", name)
        .number("paths", static_cast<double>(paths))
        .number("memoryBytes", static_cast<double>(memoryBytes))
        .number("storedBytes", static_cast<double>(storedBytes));
    Json times;
    for (std::size_t i = 0; i < operationCount; ++i) {
        const auto operation = static_cast<Operation>(i);
        if (of(operation).empty()) continue;
        times.number(keyOf(operation), nanoseconds(operation));
    }
    all.object("nanosecondsPerPath", times);
    return all;
}

std::vector<Series> measure(std::vector<SubjectPtr>& subjects,
                            const Plan& plan) {
    return Measurement(subjects, plan).result();
}

}  // namespace bench
