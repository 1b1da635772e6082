#include "hosts/python/host/SharedHost.hpp"

#include <dlfcn.h>
#include <link.h>
#include <pthread.h>

#include <memory>
#include <stdexcept>
#include <string>

#include "hosts/embedded/FilesetClass.hpp"
#include "qztessel/Version.hpp"

namespace tessel::python {

namespace {

// Python loads modules where nobody else looks for symbols. This shows the
// symbols of this module, VXHostInterface above all, to what is loaded later.
void showInterface() {
    Dl_info own{};
    const auto* const here = reinterpret_cast<const void*>(&showInterface);
    if (dladdr(here, &own) == 0)
        throw std::runtime_error("The loader does not know this module.");
    // The handle keeps the module loaded, as Python does in any case.
    void* const module =
        dlopen(own.dli_fname, RTLD_NOW | RTLD_NOLOAD | RTLD_GLOBAL);
    if (module == nullptr) throw std::runtime_error(dlerror());
    if (dlsym(RTLD_DEFAULT, "VXHostInterface") !=
        dlsym(module, "VXHostInterface"))
        throw std::runtime_error(
            "This process has a host of its own, and cannot have a second.");
}

// The name under which the plug-in is installed: libqztessel.so.MAJOR.
std::string installedName() {
    const std::string version = versionText;
    return "libqztessel.so." + version.substr(0, version.find('.'));
}

}  // namespace

// NOLINTBEGIN(cppcoreguidelines-avoid-non-const-global-variables)
std::mutex SharedHost::mutex;
embedded::Host* SharedHost::host = nullptr;
// NOLINTEND(cppcoreguidelines-avoid-non-const-global-variables)

std::optional<std::filesystem::path> SharedHost::installedPlugin() {
    showInterface();
    const auto close = [](void* handle) { dlclose(handle); };
    const std::unique_ptr<void, decltype(close)> plugin(
        dlopen(installedName().c_str(), RTLD_NOW | RTLD_LOCAL), close);
    if (plugin == nullptr) return std::nullopt;
    link_map* map = nullptr;
    if (dlinfo(plugin.get(), RTLD_DI_LINKMAP, &map) != 0)
        throw std::runtime_error(dlerror());
    return map->l_name;
}

void SharedHost::start(const std::filesystem::path& plugin,
                       const std::filesystem::path& messages) {
    showInterface();
    const Turn turn;
    if (host == nullptr) {
        embedded::HostOptions options;
        options.messages = messages;
        host = std::make_unique<embedded::Host>(options).release();
        pthread_atfork([] { mutex.lock(); }, [] { mutex.unlock(); },
                       [] { mutex.unlock(); });
    }
    if (!host->hasClass(embedded::filesetClassName)) host->loadModule(plugin);
}

}  // namespace tessel::python
