#pragma once

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "hosts/embedded/Errors.hpp"
#include "hosts/embedded/Registry.hpp"

namespace tessel::embedded {

// Module is one module file in memory.
//
// Ownership: owns the loader's handle and closes it in its destructor; by then,
//   everything whose code is in the module must be deleted.
class Module {
public:
    struct Closer {
        void operator()(void* handle) const noexcept;
    };
    using Handle = std::unique_ptr<void, Closer>;

    Module(std::filesystem::path path, Handle handle);

    const std::filesystem::path& path() const noexcept { return path_; }
    // The file name up to ".so".
    std::string name() const;

    // A function that the module exports, or null.
    HostModuleEntry find(const std::string& function) const;

    // Calls the entry VXTerminate_libX, if there is one.
    void terminate() const noexcept {
        if (terminate_ != nullptr) terminate_();
    }

private:
    std::filesystem::path path_;
    Handle handle_;
    // Found early: to end a module takes no memory.
    HostModuleEntry terminate_;
};

// Modules loads module files and lets them register their classes.
//
// Ownership: owns the modules; refers to the registry and the errors, which
//   must outlive it.
class Modules {
public:
    Modules(Registry& registry, const Errors& errors)
        : registry_(registry), errors_(errors) {}

    // Loads a module file and calls its entry. For a module that is loaded
    // already it only calls the entry. Raises moduleMissing, moduleUnreadable,
    // interfaceMissing, entryMissing or entryFailed; a module that
    // failed is unloaded again, and its classes are removed.
    void load(const std::filesystem::path& file);

    // Removes the classes of a module, or removes them and unloads it. Raises
    // moduleNotLoaded, or moduleInUse while instances of its classes live.
    void removeClasses(const std::filesystem::path& file);
    void unload(const std::filesystem::path& file);

    // Unloads all modules. Their classes must be gone.
    void unloadAll() noexcept;

private:
    using Loaded = std::vector<std::unique_ptr<Module>>;

    // The loaded module of a canonical path, or the end.
    Loaded::iterator find(const std::filesystem::path& file);
    // The same for any path, with its classes removed.
    Loaded::iterator withoutClasses(const std::filesystem::path& file);
    std::unique_ptr<Module> open(const std::filesystem::path& file) const;
    void enter(const Module& module);

    Registry& registry_;
    const Errors& errors_;
    Loaded modules_;
};

}  // namespace tessel::embedded
