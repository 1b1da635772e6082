#include "hosts/embedded/Errors.hpp"

#include <string>
#include <vector>

namespace tessel::embedded {

void Errors::raise(std::string_view identifier,
                   std::span<const HostMessageArgument> arguments) const {
    throw HostException(
        std::string(identifier),
        std::vector<HostMessageArgument>(arguments.begin(), arguments.end()),
        catalogue_.format(identifier, arguments));
}

void Errors::raiseOwn(
    std::string_view key,
    std::initializer_list<HostMessageArgument> arguments) const {
    raise("VELOX:embedded:" + std::string(key),
          {arguments.begin(), arguments.size()});
}

}  // namespace tessel::embedded
