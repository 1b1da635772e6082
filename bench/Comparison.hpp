#pragma once

#include <functional>
#include <string>

#include "bench/Subject.hpp"

// The library measured: beside its rivals, on growing lists, and on awkward
// ones. Every function prints tables in markdown, writes the same as JSON if
// asked, and throws std::runtime_error if there is no list or if what is
// measured does not give its paths back.
namespace bench {

struct Options {
    int runs = 5;             // of which medians are taken
    std::string jsonFile;     // none if empty
    bool compressors = true;  // also the general compressors, which are slow
    // Makes a further subject of compareRivals, the library in a host, which
    // takes a plug-in and a program that exports the host's interface. May be
    // empty.
    std::function<SubjectPtr(const tessel::paths::PathSplitter&)> host;
};

void compareRivals(const std::string& listName, const Options& options);
void measureGrowth(const std::string& listName, const Options& options);
void compareOrder(const std::string& sortedName,
                  const std::string& shuffledName, const Options& options);
void measureShapes(const Options& options);

}  // namespace bench
