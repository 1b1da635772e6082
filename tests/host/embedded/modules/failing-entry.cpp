#include <memory>
#include <stdexcept>

#include "binding/HostInterface.hpp"

// A module whose entry registers a class and then fails.
namespace {

class UnluckyClass : public tessel::HostClassInfo {
public:
    const char* className() const noexcept override { return "Unlucky"; }
    void defineMembers(tessel::HostClass* /*definedClass*/) override {}
    void* createNativeObject() override { return nullptr; }
    void destroyNativeObject(void* /*native*/) noexcept override {}
};

}  // namespace

extern "C" void VXInitialize_libfailing_entry() {
    tessel::HostInterface& host =
        *VXHostInterface(tessel::hostInterfaceVersion)->host;
    host.hostRegisterClass(host.hostGlobalPackage("velox"),
                           std::make_unique<UnluckyClass>());
    throw std::runtime_error("This module never starts.");
}
