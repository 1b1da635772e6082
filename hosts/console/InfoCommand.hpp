#pragma once

#include <optional>
#include <string>

#include "hosts/console/Command.hpp"

namespace tessel::console {

// `tessel info`: counts and sizes, as a table, JSON or picture.
class InfoCommand : public Command {
public:
    InfoCommand();
    ExitStatus run(Session& session) override;

private:
    std::string file_;
    bool json_ = false;
    std::optional<std::string> plot_;
};

}  // namespace tessel::console
