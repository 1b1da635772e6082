#pragma once

#include <stdexcept>
#include <variant>

#include "fuzz/Input.hpp"
#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/Host.hpp"

namespace tessel::fuzz {

// The one host of the process, with the plug-in in it.
inline embedded::Host& pluggedHost() {
    static embedded::Host host{[] {
        embedded::HostOptions options;
        options.messages = QZTESSEL_MESSAGES;
        return options;
    }()};
    static const bool loaded = (host.loadModule(QZTESSEL_PLUGIN), true);
    static_cast<void>(loaded);
    return host;
}

// Runs a call that the host may refuse. Any exception but the documented ones
// ends the process, that memory ran out among them.
template <class Call>
bool allowed(Call call) {
    try {
        call();
        return true;
    } catch (const embedded::HostException& refusal) {
        require(refusal.identifier().find("outOfMemory") == std::string::npos,
                "memory suffices");
    } catch (const std::bad_variant_access&) {
    } catch (const std::logic_error&) {
    }
    return false;
}

}  // namespace tessel::fuzz
