#include "hosts/embedded/HostException.hpp"

#include <utility>

namespace tessel::embedded {

HostException::HostException(std::string messageIdentifier,
                             std::vector<HostMessageArgument> messageArguments,
                             std::string messageText)
    : name_(std::move(messageIdentifier)),
      values_(std::move(messageArguments)),
      text_(std::move(messageText)) {}

std::string toText(const HostMessageArgument& argument) {
    if (const auto* number = std::get_if<std::int64_t>(&argument)) {
        return std::to_string(*number);
    }
    return std::get<std::string>(argument);
}

}  // namespace tessel::embedded
