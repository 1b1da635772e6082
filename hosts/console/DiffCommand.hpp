#pragma once

#include <string>

#include "hosts/console/Command.hpp"

namespace tessel::console {

// `tessel diff`: what is in one archive and not in the other.
class DiffCommand : public Command {
public:
    DiffCommand();
    ExitStatus run(Session& session) override;

private:
    std::string before_;
    std::string after_;
    bool nul_ = false;
};

}  // namespace tessel::console
