#include "binding/ClassInfo.hpp"
#include "binding/HostAccess.hpp"

// The two functions that the module exports. A module loaded again after it
// was unloaded starts afresh.

// Registers the class: on every call in the host's alternative mode, otherwise
// once, by whichever call comes first and does not throw.
//
// Throws HostRefusedException when the process offers no host of the right
// version, and whatever the host raises.
extern "C" __attribute__((visibility("default"))) void
VXInitialize_libqztessel() {
    if (tessel::binding::host().hostAlternativeMode()) {
        tessel::binding::registerHuffmanPaths();
        return;
    }
    static const tessel::HostClass* const registered =
        tessel::binding::registerHuffmanPaths();
    static_cast<void>(registered);
}

// Does nothing: the host owns what was registered.
extern "C" __attribute__((visibility("default"))) void
VXTerminate_libqztessel() {}
