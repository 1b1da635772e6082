#pragma once

#include <filesystem>
#include <map>
#include <span>
#include <stdexcept>
#include <string>
#include <string_view>

#include "binding/HostInterface.hpp"

namespace tessel::embedded {

// A catalogue that cannot be read; what() says where and why.
class CatalogueException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// MessageCatalogue holds the texts of messages, by identifier.
//
// It is a folder of text files. The file A/B/c.messages has the messages of the
// component A:B:c, one per line: the key, a colon, a blank, the text. {0}, {1}
// and so on are replaced by arguments. Blank lines and lines that start with #
// are ignored.
// Threads: any number of readers; it never changes.
class MessageCatalogue {
public:
    // Reads all files of the folder. Throws CatalogueException if there is no
    // such folder, or a line that is no message.
    explicit MessageCatalogue(const std::filesystem::path& folder);

    // The text of a message with its arguments filled in. A placeholder
    // without an argument stays as it is. For an unknown identifier the
    // identifier, followed by the arguments.
    std::string format(std::string_view identifier,
                       std::span<const HostMessageArgument> arguments) const;

private:
    void read(const std::filesystem::path& file, const std::string& component);

    std::map<std::string, std::string, std::less<>> texts_;
};

}  // namespace tessel::embedded
