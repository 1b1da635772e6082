#pragma once

#include <cstdint>
#include <span>
#include <string>

namespace tessel::paths {

// The bytes of a file, or of a pipe up to its end. Throws std::system_error,
// whose message has the file's name.
std::string readWholeFile(const std::string& file);

// Writes a file beside the target, waits until it is on disk, and gives it
// the target's name, so that the target is at any time whole: the old one, the
// new one, or none if there was none. A symbolic link is followed, to a file
// that is not there yet, too, and a target keeps its permissions. A pipe or a
// device is not replaced: the bytes are written to it.
//
// Throws std::system_error, whose message has the file's name; what was written
// is removed then. What a killed process left, a hidden file
// `.NAME.tessel-XXXXXX.tmp`, is removed by the next one that replaces the same
// file.
void replaceFile(const std::string& file, std::span<const std::uint8_t> bytes);

}  // namespace tessel::paths
