#pragma once

#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include "binding/HostInterface.hpp"

namespace tessel::embedded {

// A package, with the packages inside it. Packages are added, never removed.
class Package final : public HostPackage {
public:
    explicit Package(std::string fullName) : fullName_(std::move(fullName)) {}

    // Empty for the one package that holds all others.
    const std::string& fullName() const noexcept { return fullName_; }

    // The package of a simple name inside this one, or null.
    Package* find(std::string_view name);

    // The package of a dotted name inside this one, made if need be.
    Package& add(std::string_view dottedName);

private:
    std::string fullName_;
    std::map<std::string, std::unique_ptr<Package>, std::less<>> inner_;
};

}  // namespace tessel::embedded
