#include "hosts/embedded/Packages.hpp"

namespace tessel::embedded {

Package* Package::find(std::string_view name) {
    const auto found = inner_.find(name);
    return found == inner_.end() ? nullptr : found->second.get();
}

Package& Package::add(std::string_view dottedName) {
    const std::size_t dot = dottedName.find('.');
    const std::string name(dottedName.substr(0, dot));
    const std::string prefix = fullName_.empty() ? "" : fullName_ + ".";
    std::unique_ptr<Package>& package = inner_[name];
    if (!package) package = std::make_unique<Package>(prefix + name);
    if (dot == std::string_view::npos) return *package;
    return package->add(dottedName.substr(dot + 1));
}

}  // namespace tessel::embedded
