#pragma once

#include <optional>
#include <string>

#include "hosts/console/Command.hpp"
#include "hosts/console/ListInput.hpp"

namespace tessel::console {

// `tessel pack`: packs a list or a folder's contents, or appends them.
class PackCommand : public Command {
public:
    PackCommand();
    ExitStatus run(Session& session) override;

private:
    class Target;

    void checkWords(const Session& session) const;
    void readInput(ListInput& input, const ListInput::Sink& sink) const;

    std::optional<std::string> list_;
    std::string file_;
    std::optional<std::string> folder_;
    bool showFolders_ = false;
    bool nul_ = false;
    bool skipEmpty_ = false;
    bool append_ = false;
    bool force_ = false;
    std::string level_ = "normal";
};

}  // namespace tessel::console
