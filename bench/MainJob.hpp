#pragma once

#include <string>

namespace bench {

// The main job on the list or folder of that name: reads, splits, counts,
// codes, adds, serializes, restores, iterates, fetches, and compares every
// path with the input, in memory for the list and not much more. Prints one
// table with what each step took. Returns true and prints 'all N paths
// identical', or returns false and prints the first difference. Throws
// PathListError if there is no list.
bool runMainJob(const std::string& listOrFolder);

}  // namespace bench
