#pragma once

#include <span>
#include <string>

#include "hosts/console/Session.hpp"

namespace tessel::console {

// Runs `tessel` with these words after its name. Returns the exit status.
// Writes one line to standard error if the command fails. Throws
// ClosedPipeException only.
int runConsole(std::span<const std::string> words, Session& session);

}  // namespace tessel::console
