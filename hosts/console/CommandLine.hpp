#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace CLI {  // NOLINT(readability-identifier-naming)
class App;
class Option;
}  // namespace CLI

namespace tessel::console {

// CommandLine describes what follows a command's name, reads it and explains
// it.
//
// A negative number, such as "-5", is an argument; "-0" may be a flag.
//
// Ownership: borrows the targets of flags, values and arguments, which must
//   outlive it. They are set by parse.
// Errors: parse throws ConsoleException with the status Usage.
class CommandLine {
public:
    enum class Need { Optional, Required };

    // What a command line asks for.
    enum class Request { Run, Help };

    // summary   one line
    // examples  whole lines, shown at the end of the help
    CommandLine(std::string command, const std::string& summary,
                const std::string& examples);
    CommandLine(const CommandLine&) = delete;
    CommandLine& operator=(const CommandLine&) = delete;
    ~CommandLine();

    // ---- Flags and values: names are such as "-o" or "-f,--force" ----

    void flag(const std::string& names, bool& target, const std::string& help);
    void value(const std::string& names, const std::string& kind,
               std::optional<std::string>& target, const std::string& help);
    void value(const std::string& names, const std::string& kind,
               std::string& target, Need need, const std::string& help);
    void number(const std::string& names, const std::string& kind,
                std::optional<std::uint64_t>& target, const std::string& help);
    void choice(const std::string& names,
                const std::vector<std::string>& choices, std::string& target,
                const std::string& help);

    // ---- Arguments, in the order in which they are described ----

    void argument(const std::string& name, std::string& target,
                  const std::string& help);
    void argument(const std::string& name, std::optional<std::string>& target,
                  const std::string& help);
    void arguments(const std::string& name, std::vector<std::string>& target,
                   Need need, const std::string& help);

    // ---- Use ----

    Request parse(std::span<const std::string> words);
    std::string help() const;

    // A ConsoleException that points to the command's help.
    [[noreturn]] void fail(const std::string& problem) const;

private:
    void restoreWords();

    std::string command_;
    std::unique_ptr<CLI::App> app_;
    std::vector<std::string*> words_;  // targets whose words were protected
    std::vector<std::vector<std::string>*> wordLists_;
};

}  // namespace tessel::console
