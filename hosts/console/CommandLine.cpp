#include "hosts/console/CommandLine.hpp"

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <algorithm>
#include <charconv>
#include <sstream>
#include <system_error>
#include <utility>

#include "hosts/console/ConsoleException.hpp"

namespace tessel::console {

namespace {

// The parser would change some words: it reads "[ab]" as a list of values and
// drops an empty word. This character is put in front of such words before
// parsing and removed after it. Words that start with the character get it as
// well, so that removing it leaves them as they were.
constexpr char protection = '\x1f';

bool needsProtection(std::string_view word) noexcept {
    return word.empty() || word.front() == '[' || word.front() == protection;
}

std::string protect(const std::string& word) {
    return needsProtection(word) ? protection + word : word;
}

// The same for the value in "--name=value".
std::string protectFlag(std::string word) {
    const std::size_t value = word.find('=') + 1;
    if (word.starts_with("--") && value > 0 &&
        needsProtection(std::string_view(word).substr(value)))
        word.insert(value, 1, protection);
    return word;
}

void unprotect(std::string& word) {
    if (word.starts_with(protection)) word.erase(0, 1);
}

// The words as the parser takes them: from the back, with marks.
std::vector<std::string> wordsForParser(std::span<const std::string> words) {
    std::vector<std::string> reversed;
    bool flagsEnded = false;
    for (const std::string& word : words) {
        reversed.push_back(protect(flagsEnded ? word : protectFlag(word)));
        flagsEnded |= word == "--";
    }
    std::ranges::reverse(reversed);
    return reversed;
}

// Empty if the word is a number, otherwise what is wrong with it. The parser
// by itself takes "-1" and numbers from 2^64 on for the largest number.
std::string problemOfNumber(const std::string& word) {
    std::uint64_t number = 0;
    const char* end = word.data() + word.size();
    const auto read = std::from_chars(word.data(), end, number);
    if (read.ec == std::errc() && read.ptr == end) return "";
    return fmt::format("'{}' is no number from 0 to 2^64 - 1", word);
}

constexpr std::size_t helpColumn = 24;
constexpr std::size_t helpWidth = 79 - helpColumn;

// Breaks a text into lines that fit beside the names.
std::string wrappedHelp(const std::string& help) {
    std::istringstream words(help);
    std::string text;
    std::size_t used = 0;
    for (std::string word; words >> word; used += word.size()) {
        if (used > 0 && used + 1 + word.size() > helpWidth) {
            text += '\n';
            used = 0;
        } else if (used > 0) {
            text += ' ';
            ++used;
        }
        text += word;
    }
    return text;
}

CLI::Option* described(CLI::Option* option, const std::string& kind) {
    // As elsewhere, the last one counts, so that scripts and aliases can give
    // values that a user overrides.
    if (!option->get_positional()) option->take_last();
    return option->type_name(kind)->description(
        wrappedHelp(option->get_description()));
}

// A parser's sentence as part of a line.
std::string asPart(std::string text) {
    std::erase(text, protection);
    std::replace(text.begin(), text.end(), '\n', ' ');
    while (!text.empty() && (text.back() == ' ' || text.back() == '.'))
        text.pop_back();
    if (text.size() > 1 && text[1] >= 'a' && text[1] <= 'z' && text[0] >= 'A' &&
        text[0] <= 'Z')
        text[0] = static_cast<char>(text[0] - 'A' + 'a');
    return text;
}

}  // namespace

CommandLine::CommandLine(std::string command, const std::string& summary,
                         const std::string& examples)
    : command_(std::move(command)),
      app_(std::make_unique<CLI::App>(summary, command_)) {
    app_->set_help_flag("--help", "Explain the command and exit");
    app_->footer("Examples:\n" + examples);
    app_->get_formatter()->column_width(helpColumn);
}

CommandLine::~CommandLine() = default;

void CommandLine::flag(const std::string& names, bool& target,
                       const std::string& help) {
    app_->add_flag(names, target, wrappedHelp(help));
}

void CommandLine::value(const std::string& names, const std::string& kind,
                        std::optional<std::string>& target,
                        const std::string& help) {
    described(app_->add_option_function<std::string>(
                  names,
                  [&target](std::string word) {
                      unprotect(word);
                      target = std::move(word);
                  },
                  help),
              kind);
}

void CommandLine::value(const std::string& names, const std::string& kind,
                        std::string& target, Need need,
                        const std::string& help) {
    words_.push_back(&target);
    described(app_->add_option(names, target, help), kind)
        ->required(need == Need::Required);
}

void CommandLine::number(const std::string& names, const std::string& kind,
                         std::optional<std::uint64_t>& target,
                         const std::string& help) {
    described(app_->add_option(names, target, help)->check(problemOfNumber),
              kind);
}

void CommandLine::choice(const std::string& names,
                         const std::vector<std::string>& choices,
                         std::string& target, const std::string& help) {
    described(app_->add_option(names, target, help)
                  ->check(CLI::IsMember(choices).description("")),
              fmt::format("{}", fmt::join(choices, "|")));
}

void CommandLine::argument(const std::string& name, std::string& target,
                           const std::string& help) {
    value(name, "", target, Need::Required, help);
}

void CommandLine::argument(const std::string& name,
                           std::optional<std::string>& target,
                           const std::string& help) {
    value(name, "", target, help);
}

void CommandLine::arguments(const std::string& name,
                            std::vector<std::string>& target, Need need,
                            const std::string& help) {
    wordLists_.push_back(&target);
    described(app_->add_option(name, target, help), "")
        ->required(need == Need::Required);
}

CommandLine::Request CommandLine::parse(std::span<const std::string> words) {
    try {
        app_->parse(wordsForParser(words));
    } catch (const CLI::CallForHelp&) {
        return Request::Help;
    } catch (const CLI::ParseError& error) {
        fail(asPart(error.what()));
    }
    restoreWords();
    return Request::Run;
}

std::string CommandLine::help() const { return app_->help() + "\n"; }

void CommandLine::fail(const std::string& problem) const {
    throw ConsoleException(ExitStatus::Usage, fmt::format("{}; see `{} --help`",
                                                          problem, command_));
}

void CommandLine::restoreWords() {
    for (std::string* word : words_) unprotect(*word);
    for (auto* list : wordLists_)
        for (std::string& word : *list) unprotect(word);
}

}  // namespace tessel::console
