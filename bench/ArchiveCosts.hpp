#pragma once

#include <string>

#include "bench/Comparison.hpp"

namespace bench {

// What an archive costs before the first answer: the time to open a mapped
// file, the memory that it then takes beside the file's own pages, and how
// much a second core gains when it is built. Prints a table in markdown,
// writes the same as JSON if asked, and throws std::runtime_error if there is
// no list, std::system_error if there is no place for a temporary file.
void measureArchive(const std::string& listName, const Options& options);

}  // namespace bench
