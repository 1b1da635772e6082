#pragma once

#include <string>

// The library measured: beside its rivals, on growing lists, and on awkward
// ones. Every function prints tables in markdown, writes the same as JSON if
// asked, and throws std::runtime_error if there is no list or if what is
// measured does not give its paths back.
namespace bench {

struct Options {
    int runs = 5;          // of which medians are taken
    std::string jsonFile;  // none if empty
};

void compareRivals(const std::string& listName, const Options& options);
void measureGrowth(const std::string& listName, const Options& options);
void compareOrder(const std::string& sortedName,
                  const std::string& shuffledName, const Options& options);
void measureShapes(const Options& options);

}  // namespace bench
