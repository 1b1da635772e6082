#pragma once

#include "binding/HostInterface.hpp"

namespace tessel::binding {

// HuffmanPathsCOSClassInfo describes the class HuffmanPaths to the host. The
// native object of an instance is a HuffmanPathTree.
//
// Invariants: no data of its own.
// Ownership: registerHuffmanPaths makes it and hands it to the host.
// Threads: the host's calling thread.
class HuffmanPathsCOSClassInfo final : public HostClassInfo {
public:
    const char* className() const noexcept override;

    // Adds the seven methods and the properties StringTree and Frequencies.
    void defineMembers(HostClass* definedClass) override;

    void* createNativeObject() override;
    void destroyNativeObject(void* native) noexcept override;

    // An instance is copied by its properties and by its constructor's mode
    // "copy", and saved by its properties and its stored form: the host may
    // do both.
    bool copiesInstances() const noexcept override { return true; }
    bool savesInstances() const noexcept override { return true; }

    // Restores the coder from a struct with the fields StringTree and
    // PathTree. Any other value, or an empty StringTree, leaves the instance
    // as it is. Never throws: prints one line on standard output when the
    // value cannot be restored, and leaves the instance as the attempt left it.
    void customLoad(HostArray* instance, const HostSavedValue* saved) override;
};

// Registers HuffmanPaths with the host unless the host has it, and returns it.
// Throws MissingPackageException, and whatever the host raises.
HostClass* registerHuffmanPaths();

}  // namespace tessel::binding
