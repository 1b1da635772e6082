#include "hosts/embedded/HostException.hpp"

#include <utility>

namespace tessel::embedded {

HostException::HostException(std::string identifier,
                             std::vector<HostMessageArgument> arguments,
                             std::string text)
    : identifier_(std::move(identifier)),
      arguments_(std::move(arguments)),
      text_(std::move(text)) {}

std::string toText(const HostMessageArgument& argument) {
    if (const auto* number = std::get_if<std::int64_t>(&argument))
        return std::to_string(*number);
    return std::get<std::string>(argument);
}

}  // namespace tessel::embedded
