#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "archive/PathArchive.hpp"
#include "hosts/console/Command.hpp"
#include "hosts/console/InputFile.hpp"
#include "hosts/console/PathOutput.hpp"
#include "hosts/console/ProgressBar.hpp"

namespace tessel::console {

// `tessel list`: writes all paths, or those below a folder, or what is left of
// a damaged archive.
class ListCommand : public Command {
public:
    ListCommand();
    ExitStatus run(Session& session) override;

private:
    ExitStatus list(Session& session, PathOutput& paths) const;
    // Both write the paths of a range and count them.
    void write(const PathArchive& archive, const NumberRange& range,
               OutputBuffer& output, ProgressBar& bar,
               std::uint64_t& done) const;
    static void writeNumbered(const PathArchive& archive,
                              const NumberRange& range, PathOutput& paths,
                              ProgressBar& bar, std::uint64_t& done);
    ExitStatus salvage(Session& session, PathOutput& paths) const;
    SalvageReport salvageFrom(InputFile& input, PathVisitor visitor) const;
    bool isBelowFolder(std::string_view path) const noexcept;

    std::string file_;
    bool nul_ = false;
    bool numbers_ = false;
    bool salvage_ = false;
    std::optional<std::string> folder_;
};

}  // namespace tessel::console
