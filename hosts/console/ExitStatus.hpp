#pragma once

namespace tessel::console {

// What the command's exit status says. A signal ends it with 128 and the
// signal's number instead.
enum class ExitStatus : int {
    Success = 0,
    NoMatch = 1,   // nothing found, or a difference
    Usage = 2,     // the command line is wrong
    BadInput = 3,  // a list, number or name that cannot be taken as it is
    Damaged = 4,   // an archive is not what was written
    System = 5     // the system refused: no such file, no space, no memory
};

}  // namespace tessel::console
