#include "hosts/embedded/Packages.hpp"

namespace tessel::embedded {

Package* Package::find(std::string_view name) {
    const auto found = inner.find(name);
    return found == inner.end() ? nullptr : found->second.get();
}

Package& Package::add(std::string_view dottedName) {
    const std::size_t dot = dottedName.find('.');
    const std::string name(dottedName.substr(0, dot));
    const std::string prefix =
        dottedFullName.empty() ? "" : dottedFullName + ".";
    std::unique_ptr<Package>& package = inner[name];
    if (!package) package = std::make_unique<Package>(prefix + name);
    if (dot == std::string_view::npos) return *package;
    return package->add(dottedName.substr(dot + 1));
}

}  // namespace tessel::embedded
