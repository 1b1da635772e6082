#pragma once

namespace tessel::console {

// Makes sure that the descriptors 0 to 2 are in use. A caller may have closed
// one of them, as `>&-` does in a shell; the next file that is opened would
// get its number, and then be read as standard input or be written to as
// standard output or standard error.
//
// /dev/null is opened in place of a closed descriptor, standard input only for
// writing and the others only for reading, so that using it fails with EBADF,
// as using a closed descriptor does.
//
// Threads: call it before any other thread starts and before any file is
//   opened.
// Throws std::system_error if /dev/null cannot be opened.
void takeStandardDescriptors();

}  // namespace tessel::console
