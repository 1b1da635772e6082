#pragma once

#include <string>

#include "hosts/console/Command.hpp"

namespace tessel::console {

// `tessel export`: writes an archive's paths as a saved store, the form that
// grows and that hosts exchange.
class ExportCommand : public Command {
public:
    ExportCommand();
    ExitStatus run(Session& session) override;

private:
    std::string file_;
    std::string store_;
    bool force_ = false;
};

}  // namespace tessel::console
