#pragma once

#include <array>
#include <cstddef>
#include <string>
#include <vector>

#include "bench/Report.hpp"
#include "bench/Subject.hpp"

// Several subjects measured on one list.
namespace bench {

enum class Operation {
    Build,
    Iterate,
    FetchAll,
    FetchRandom,
    FindNumber,
    Store,
    Restore,
    Destroy
};
inline constexpr std::size_t operationCount = 8;
const char* nameOf(Operation operation);
const char* keyOf(Operation operation);

// What was measured of one subject: seconds of each operation, a run each.
struct Series {
    std::string name;
    std::size_t memoryBytes = 0;
    std::size_t storedBytes = 0;
    std::size_t paths = 0;
    std::size_t fetches = 0;  // of FetchRandom and FindNumber
    std::array<std::vector<double>, operationCount> seconds;

    const std::vector<double>& of(Operation operation) const {
        return seconds[static_cast<std::size_t>(operation)];
    }
    // Of one operation in every run, in nanoseconds per path. None of an
    // operation that the subject does not have.
    std::vector<double> runs(Operation operation) const;
    // Their median; not a number if there are none.
    double nanoseconds(Operation operation) const;
    // The median of how many times another series' it is in the same run; not
    // a number if one of the two has none.
    double times(const Series& other, Operation operation) const;
    double memoryPerPath() const;
    double storedPerPath() const;
    Json json() const;
};

// How often to run what.
struct Plan {
    int runs = 5;
    int storeRuns = 5;  // the first ones of them that also store and restore
    std::size_t fetches = 100'000;
};

// Measures the subjects, all of which are alive at the same time, so that in
// each run one operation of all comes before the next one. In the first run
// each answer is verified before anything is timed. Throws
// std::runtime_error if a subject does not give its list back.
std::vector<Series> measure(std::vector<SubjectPtr>& subjects,
                            const Plan& plan);

}  // namespace bench
