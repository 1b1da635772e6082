#pragma once

#include "bench/Subject.hpp"

namespace bench {

// The library as a user of the plug-in gets it: loaded into the embedded host,
// every path a value of that host. A process has room for one such subject at a
// time. Throws what loading the plug-in throws.
SubjectPtr makeHostRoute(const tessel::paths::PathSplitter& splitter);

}  // namespace bench
