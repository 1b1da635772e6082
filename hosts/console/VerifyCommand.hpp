#pragma once

#include <string>
#include <vector>

#include "hosts/console/Command.hpp"

namespace tessel::console {

// `tessel verify`: reads everything and tells what is damaged, and where.
class VerifyCommand : public Command {
public:
    VerifyCommand();
    ExitStatus run(Session& session) override;

private:
    void verify(Session& session, const std::string& file);

    std::vector<std::string> files_;
};

}  // namespace tessel::console
