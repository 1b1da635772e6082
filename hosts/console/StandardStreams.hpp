#pragma once

namespace tessel::console {

// Makes sure that the descriptors 0 to 2 are taken. A caller may have closed
// one of them, as `>&-` does in a shell; the next file that is opened would
// get its number, and then be read as standard input or be written to as
// standard output.
//
// A closed descriptor becomes one of /dev/null that is open for the other
// direction, so that using it fails as it does without this (EBADF).
//
// Threads: call it before any other thread starts and before any file is
//   opened.
// Throws std::system_error if /dev/null cannot be opened.
void takeStandardDescriptors();

}  // namespace tessel::console
