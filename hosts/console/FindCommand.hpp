#pragma once

#include <optional>
#include <string>
#include <vector>

#include "archive/PathArchive.hpp"
#include "hosts/console/Command.hpp"
#include "hosts/patterns/PathMatcher.hpp"

namespace tessel::console {

// `tessel find`: writes or counts the paths that match all patterns.
class FindCommand : public Command {
public:
    FindCommand();
    ExitStatus run(Session& session) override;

private:
    patterns::PatternKind kind() const;
    patterns::PathMatcher matcher() const;
    FindOptions options(ProgressBar& bar) const;

    // Whether the archive itself can find the patterns.
    bool isPlain() const noexcept { return !glob_ && !regex_ && !ignoreCase_; }

    std::uint64_t count(const PathArchive& archive,
                        const patterns::PathMatcher& matcher,
                        const FindOptions& options) const;
    std::uint64_t write(Session& session, const PathArchive& archive,
                        const patterns::PathMatcher& matcher,
                        const FindOptions& options) const;

    std::string file_;
    std::vector<std::string> patterns_;
    bool glob_ = false;
    bool regex_ = false;
    bool ignoreCase_ = false;
    bool count_ = false;
    bool numbers_ = false;
    bool nul_ = false;
    std::optional<std::string> folder_;
};

}  // namespace tessel::console
