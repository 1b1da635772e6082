#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "hosts/console/Session.hpp"

namespace tessel::console {

// Whether an existing file may be replaced.
enum class Overwrite { Refused, Allowed };

// Throws ConsoleException with the status BadInput if the file exists and may
// not be replaced. "-" never exists.
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
