#pragma once

#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/embedded/Host.hpp"
#include "paths/Batches.hpp"
#include "paths/PathList.hpp"
#include "paths/PathSplitter.hpp"

namespace tessel::embedded {

// One line of the job's table.
struct JobStep {
    std::string name;
    double seconds;
    std::size_t paths;
};

struct JobResults {
    std::size_t paths = 0;
    std::size_t keptApart = 0;
    std::size_t textBytes = 0;
    std::size_t instanceBytes = 0;  // what the heap grew by
    std::size_t storedBytes = 0;    // stored form, tree string, frequencies
    std::vector<JobStep> steps;
};

// A path did not come back as it was added; what() says which and how.
class DifferenceException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// HostJob does with a real list of paths what a data-store layer does with a
// file set: makes an instance in a host, fills it, reads it in every way,
// stores it, and reads what was restored from the store, comparing every path.
//
// Ownership: refers to the host and the list, which must outlive it.
class HostJob {
public:
    HostJob(Host& host, const paths::PathList& list);

    // Throws DifferenceException, and HostException as the host raises it.
    JobResults run();

private:
    Value makeInstance();
    void addPaths(const Value& instance);
    void readInEveryWay(const Value& instance);
    Value rebuild(const Value& instance);

    void iterate(const Value& instance, const std::string& name);
    void fetchJoined(const Value& instance, const std::string& name);
    void fetchParts(const Value& instance, const std::string& name);

    void compareInOrder(std::size_t number, std::u16string_view joined,
                        const std::string& route) const;
    // Calls visit(numbers, first number) for all path numbers, some at a time.
    // It returns how many paths it got, which must be as many.
    using Visit = std::function<std::size_t(const Value&, std::size_t)>;
    void forNumbers(const std::string& route, const Visit& visit) const;
    // Times a step on all paths.
    void step(const std::string& name, const std::function<void()>& action);

    Host& host_;
    const paths::PathList& list_;
    paths::PathSplitter splitter_;
    JobResults results_;
};

}  // namespace tessel::embedded
