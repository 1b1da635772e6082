#pragma once

#include <map>
#include <memory>
#include <string_view>
#include <vector>

#include "hosts/embedded/Classes.hpp"
#include "hosts/embedded/Errors.hpp"
#include "hosts/embedded/Names.hpp"
#include "hosts/embedded/Packages.hpp"

namespace tessel::embedded {

// Registry is the host's class system: names, packages and classes.
//
// Ownership: owns all of them; refers to the errors, which must outlive it.
class Registry {
public:
    explicit Registry(const Errors& errors) : errors_(errors) {}

    NameTable names;
    Package packages{""};
    // The module whose entry is running, or null.
    const Module* enteringModule = nullptr;

    // Null if there is none.
    ClassRecord* find(const Name* fullName) const;
    // Raises classMissing.
    ClassRecord& get(std::string_view fullName) const;
    // In the order of registration.
    std::vector<ClassRecord*> all() const;

    // Defines and registers a class. If its definition throws, there is no
    // such class and the descriptor is deleted.
    void define(Package& package, std::unique_ptr<HostClassInfo> info);

    // How many instances the classes of a module have.
    std::size_t instanceCount(const Module& module) const;
    // Removes the classes of a module, destroying their instances.
    void removeClasses(const Module& module);
    void removeAllClasses();

private:
    void remove(ClassRecord& record);

    const Errors& errors_;
    std::vector<std::unique_ptr<ClassRecord>> classes_;
};

}  // namespace tessel::embedded
