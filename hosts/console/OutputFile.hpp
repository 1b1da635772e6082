#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "hosts/console/Session.hpp"

namespace tessel::console {

// Whether an existing file may be replaced.
enum class Overwrite { Refused, Allowed };

// Whether there is such a file; a link that leads nowhere is none. Throws
// std::system_error if the system does not tell: a file that is taken for
// missing would be replaced.
bool exists(const std::string& file);

// Throws ConsoleException with the status BadInput if the file exists and may
// not be replaced, and std::system_error. "-" never exists.
void checkOverwrite(const std::string& file, Overwrite overwrite);

// Throws ConsoleException with the status Usage if bytes that are no text
// would go to a terminal.
void checkNoTerminal(const std::string& file, const Session& session);

// Replaces a file as a whole: it is the old one or the new one at every
// moment. Writes to standard output for "-". Throws std::system_error.
void replaceFile(const std::string& file, std::span<const std::uint8_t> bytes,
                 Session& session);
void replaceFile(const std::string& file, std::string_view bytes,
                 Session& session);

}  // namespace tessel::console
