#include "hosts/embedded/MessageCatalogue.hpp"

#include <charconv>
#include <fstream>

#include "hosts/embedded/HostException.hpp"

namespace tessel::embedded {

namespace {

// The component that a file speaks for, from its path inside the catalogue.
std::string componentOf(const std::filesystem::path& relative) {
    std::string component;
    for (const std::filesystem::path& part : relative.parent_path())
        component += part.string() + ":";
    return component + relative.stem().string();
}

// A placeholder {number} at the start of a text: its number and its length with
// the braces; length 0 if there is none.
struct Placeholder {
    std::size_t number = 0;
    std::size_t length = 0;
};

Placeholder placeholderAt(std::string_view text) {
    const std::size_t end = text.find('}');
    if (text.empty() || text.front() != '{' || end == std::string_view::npos)
        return {};
    Placeholder found;
    const char* const last = text.data() + end;
    const auto [parsed, error] =
        std::from_chars(text.data() + 1, last, found.number);
    if (error != std::errc() || parsed != last) return {};
    found.length = end + 1;
    return found;
}

std::string fillIn(std::string_view text,
                   std::span<const HostMessageArgument> arguments) {
    std::string filled;
    while (!text.empty()) {
        const Placeholder found = placeholderAt(text);
        if (found.length != 0 && found.number < arguments.size()) {
            filled += toText(arguments[found.number]);
            text.remove_prefix(found.length);
        } else {
            filled += text.front();
            text.remove_prefix(1);
        }
    }
    return filled;
}

std::string withoutText(std::string_view identifier,
                        std::span<const HostMessageArgument> arguments) {
    std::string listed(identifier);
    const char* separator = ": ";
    for (const HostMessageArgument& argument : arguments) {
        listed += separator + toText(argument);
        separator = "; ";
    }
    return listed;
}

}  // namespace

MessageCatalogue::MessageCatalogue(const std::filesystem::path& folder) {
    namespace fs = std::filesystem;
    if (!fs::is_directory(folder)) {
        throw CatalogueException("There is no message catalogue in '" +
                                 folder.string() + "'.");
    }
    for (const auto& entry : fs::recursive_directory_iterator(folder)) {
        if (entry.path().extension() == ".messages")
            read(entry.path(), componentOf(fs::relative(entry.path(), folder)));
    }
}

void MessageCatalogue::read(const std::filesystem::path& file,
                            const std::string& component) {
    std::ifstream in(file);
    std::string line;
    for (int number = 1; std::getline(in, line); ++number) {
        if (line.find_first_not_of(" \t\r") == std::string::npos) continue;
        if (line.front() == '#') continue;
        const std::size_t colon = line.find(": ");
        if (colon == std::string::npos || colon == 0) {
            throw CatalogueException(file.string() + ":" +
                                     std::to_string(number) +
                                     ": this line is no message.");
        }
        texts_[component + ":" + line.substr(0, colon)] =
            line.substr(colon + 2);
    }
    if (!in.eof())
        throw CatalogueException("'" + file.string() + "' cannot be read.");
}

std::string MessageCatalogue::format(
    std::string_view identifier,
    std::span<const HostMessageArgument> arguments) const {
    const auto found = texts_.find(identifier);
    return found == texts_.end() ? withoutText(identifier, arguments)
                                 : fillIn(found->second, arguments);
}

}  // namespace tessel::embedded
