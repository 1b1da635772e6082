#pragma once

#include <stop_token>

#include "packing/FunctionRef.hpp"

namespace tessel::python {

// Does long work without the interpreter's lock, on a thread of its own, while
// the calling thread goes on serving signals: twenty times per second it takes
// the lock, lets Python handle signals, and calls `tick`. When either raises,
// as Ctrl-C does, `stop` is told to stop, and the exception is thrown after
// the work has ended.
//
// The calling thread must hold the interpreter's lock. What the work throws is
// thrown here.
//
// Cost: starting a thread, some 30 microseconds. If the system refuses one,
//   the work is done on the calling thread, and signals wait.
void runInterruptibly(std::stop_source& stop, FunctionRef<void()> work,
                      FunctionRef<void()> tick);

}  // namespace tessel::python
