#pragma once

#include <optional>
#include <string>
#include <vector>

#include "hosts/console/Command.hpp"
#include "hosts/console/NumberedPaths.hpp"
#include "hosts/console/PathRange.hpp"

namespace tessel::console {

// `tessel get`: writes paths by number, or a random sample.
class GetCommand : public Command {
public:
    GetCommand();
    ExitStatus run(Session& session) override;

private:
    // One word of the command line: a range, or "-" for standard input.
    using Request = std::optional<NumberRange>;

    std::vector<PathRange> parsedWords() const;
    std::vector<Request> resolvedWords(std::uint64_t size) const;
    std::uint64_t pathsIn(const std::vector<Request>& requests) const noexcept;
    void answerInput(Session& session, const PathArchive& archive,
                     NumberedPaths& paths) const;
    void sample(const PathArchive& archive, NumberedPaths& paths) const;

    std::string file_;
    std::vector<std::string> words_;
    bool nul_ = false;
    std::optional<std::uint64_t> sampleSize_;
    std::optional<std::uint64_t> seed_;
};

}  // namespace tessel::console
