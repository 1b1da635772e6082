#pragma once

#include <optional>
#include <string>

#include "archive/PathArchive.hpp"
#include "hosts/console/Command.hpp"
#include "hosts/console/InputFile.hpp"
#include "hosts/console/PathOutput.hpp"

namespace tessel::console {

// `tessel list`: writes all paths, or those below a folder, or what is left of
// a damaged archive.
class ListCommand : public Command {
public:
    ListCommand();
    ExitStatus run(Session& session) override;

private:
    Separator separator() const noexcept;
    Numbering numbering() const noexcept;
    ExitStatus list(Session& session) const;
    ExitStatus salvage(Session& session) const;
    SalvageReport salvageFrom(InputFile& input, PathVisitor visitor) const;

    std::string file_;
    bool nul_ = false;
    bool numbers_ = false;
    bool salvage_ = false;
    std::optional<std::string> folder_;
};

}  // namespace tessel::console
