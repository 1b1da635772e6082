#include "hosts/embedded/Modules.hpp"

#include <dlfcn.h>

#include <algorithm>
#include <optional>
#include <utility>

namespace tessel::embedded {

namespace {

namespace fs = std::filesystem;

// One spelling for a file, however it was named.
fs::path resolved(const fs::path& file) {
    std::error_code ignored;
    fs::path path = fs::weakly_canonical(file, ignored);
    return path.empty() ? file : path;
}

// While it lives, what is registered belongs to the module.
class Entering {
public:
    Entering(Registry& registry, const Module& module) noexcept
        : registry_(registry),
          outer_(std::exchange(registry.enteringModule, &module)) {}
    Entering(const Entering&) = delete;
    Entering& operator=(const Entering&) = delete;
    ~Entering() { registry_.enteringModule = outer_; }

private:
    Registry& registry_;
    const Module* outer_;
};

}  // namespace

void Module::Closer::operator()(void* handle) const noexcept {
    dlclose(handle);
}

Module::Module(fs::path path, Handle handle)
    : path_(std::move(path)),
      handle_(std::move(handle)),
      terminate_(find("VXTerminate_" + name())) {}

std::string Module::name() const {
    const std::string fileName = path_.filename().string();
    return fileName.substr(0, fileName.find(".so"));
}

HostModuleEntry Module::find(const std::string& function) const {
    return reinterpret_cast<HostModuleEntry>(
        dlsym(handle_.get(), function.c_str()));
}

Modules::Loaded::iterator Modules::find(const fs::path& file) {
    return std::find_if(modules_.begin(), modules_.end(),
                        [&](const auto& m) { return m->path() == file; });
}

std::unique_ptr<Module> Modules::open(const fs::path& file) const {
    if (!fs::is_regular_file(file))
        errors_.raiseOwn("moduleMissing", {file.string()});
    Module::Handle handle(dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL));
    if (handle == nullptr) {
        const std::string reason = dlerror();
        const bool lacksSymbol =
            reason.find("undefined symbol") != std::string::npos;
        errors_.raiseOwn(lacksSymbol ? "interfaceMissing" : "moduleUnreadable",
                         {file.string(), reason});
    }
    return std::make_unique<Module>(file, std::move(handle));
}

// Calls the entry; what it registers belongs to the module. When it fails, the
// text of the failure is copied while the module's code is still there.
void Modules::enter(const Module& module) {
    const std::string name = "VXInitialize_" + module.name();
    const HostModuleEntry entry = module.find(name);
    if (entry == nullptr)
        errors_.raiseOwn("entryMissing", {module.path().string(), name});
    std::optional<std::string> failure;
    try {
        const Entering entering(registry_, module);
        entry();
    } catch (const std::exception& exception) {
        failure = exception.what();
    } catch (...) {
        failure = "an unknown exception";
    }
    if (failure)
        errors_.raiseOwn("entryFailed", {module.path().string(), *failure});
}

void Modules::load(const fs::path& file) {
    const fs::path path = resolved(file);
    const auto present = find(path);
    if (present != modules_.end()) {
        enter(**present);
        return;
    }
    std::unique_ptr<Module> module = open(path);
    modules_.reserve(modules_.size() + 1);
    try {
        enter(*module);
    } catch (...) {
        registry_.removeClasses(*module);
        throw;
    }
    modules_.push_back(std::move(module));
}

Modules::Loaded::iterator Modules::withoutClasses(const fs::path& file) {
    const auto present = find(resolved(file));
    if (present == modules_.end())
        errors_.raiseOwn("moduleNotLoaded", {file.string()});
    const std::size_t instances = registry_.instanceCount(**present);
    if (instances != 0) {
        errors_.raiseOwn("moduleInUse",
                         {file.string(), static_cast<std::int64_t>(instances)});
    }
    registry_.removeClasses(**present);
    return present;
}

void Modules::removeClasses(const fs::path& file) { withoutClasses(file); }

void Modules::unload(const fs::path& file) {
    const auto present = withoutClasses(file);
    (*present)->terminate();
    modules_.erase(present);
}

void Modules::unloadAll() noexcept {
    while (!modules_.empty()) {
        modules_.back()->terminate();
        modules_.pop_back();
    }
}

}  // namespace tessel::embedded
