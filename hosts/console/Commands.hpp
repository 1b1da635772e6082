#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "hosts/console/Command.hpp"

namespace tessel::console {

// The command of this name, or null if there is none.
std::unique_ptr<Command> makeCommand(std::string_view name);

// What `tessel --help` writes.
std::string generalHelp();

}  // namespace tessel::console
