#pragma once

#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "hosts/console/Command.hpp"

namespace tessel::console {

// `tessel number`: writes the numbers of paths.
class NumberCommand : public Command {
public:
    NumberCommand();
    ExitStatus run(Session& session) override;

private:
    void answer(Session& session, const PathArchive& archive,
                std::string_view path);
    void answerInput(Session& session, const PathArchive& archive,
                     ProgressBar& bar);

    std::string file_;
    std::vector<std::string> paths_;
    bool nul_ = false;
    bool foundAll_ = true;
};

}  // namespace tessel::console
