#include "hosts/embedded/Packages.hpp"

namespace tessel::embedded {

Package* Package::find(std::string_view name) {
    const auto found = inner_.find(name);
    return found == inner_.end() ? nullptr : found->second.get();
}

Package& Package::add(std::string_view dottedName) {
    Package* outer = this;
    for (;;) {
        const std::size_t dot = dottedName.find('.');
        const std::string name(dottedName.substr(0, dot));
        std::unique_ptr<Package>& package = outer->inner_[name];
        if (!package)
            package = std::make_unique<Package>(
                outer->fullName_.empty() ? name
                                         : outer->fullName_ + "." + name);
        if (dot == std::string_view::npos) return *package;
        outer = package.get();
        dottedName.remove_prefix(dot + 1);
    }
}

}  // namespace tessel::embedded
