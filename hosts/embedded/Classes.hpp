#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "binding/HostInterface.hpp"
#include "hosts/embedded/Names.hpp"
#include "hosts/embedded/Value.hpp"

// Classes as the host keeps them, and their instances.
namespace tessel::embedded {

class ClassRecord;
class Instance;
class Module;

struct DeclaredArgument {
    std::string typeName;
    std::string name;
};

// What a method declares. How many inputs and outputs a call may have:
//
//   no mark         all declared inputs; all declared outputs or none
//   optional tail   at most the declared ones; the method checks the rest
//   outputs mark    all declared inputs; at most the declared outputs
class Signature final : public HostSignature {
public:
    std::vector<DeclaredArgument> inputs;
    std::vector<DeclaredArgument> outputs;
    bool optionalTail = false;
    bool fewerOutputs = false;
};

// How a method is called. A method without a body cannot be called at all.
enum class MethodKind : std::uint8_t { Constructor, OfInstances, Static, None };

// A method, with what its descriptor answered when its class was defined.
struct MethodRecord {
    std::string name;
    std::unique_ptr<HostMethodInfo> info;
    MethodKind kind = MethodKind::None;
    HostAccess access = HostAccess::Public;
    const Signature* signature = nullptr;
};

// A property as add-property was given it.
struct PropertyRecord {
    const Name* name;
    std::string description;
    std::string typeName;
    std::uint32_t attributeBits;
    HostAccess getAccess;
    HostAccess setAccess;
    HostPropertyGetter getter;
    HostPropertySetter setter;
    HostValueDisposer disposer;

    bool has(std::uint32_t bits) const noexcept {
        return (attributeBits & bits) == bits;
    }
    // Whether instances are saved with it.
    bool isSaved() const noexcept;
    // Whether copies of instances get its value.
    bool isCopied() const noexcept;
};

// ClassRecord is a class: its descriptor, its members and its instances.
//
// Invariants: there are no living instances when it is deleted.
// Ownership: owns the descriptors and deletes them in the reverse order in
//   which they were added, the class's own last. Values own the instances.
class ClassRecord final : public HostClass {
public:
    ClassRecord(const Name* name, const Module* module,
                std::unique_ptr<HostClassInfo> info);
    ClassRecord(const ClassRecord&) = delete;
    ClassRecord& operator=(const ClassRecord&) = delete;
    ~ClassRecord();

    const std::string& fullName() const noexcept { return name_->str(); }
    const Name* name() const noexcept { return name_; }
    // The module whose entry was running at registration, or null.
    const Module* module() const noexcept { return module_; }
    HostClassInfo& info() const noexcept { return *info_; }

    // Null if there is none of that name.
    const MethodRecord* findMethod(std::string_view method) const noexcept;
    // The method of the class's own name.
    const MethodRecord* constructor() const noexcept;
    const PropertyRecord* findProperty(std::string_view property) const;

    const std::vector<MethodRecord>& methods() const noexcept {
        return methods_;
    }

    // Members may be added while the class is being defined. The class owns a
    // method, also if adding it throws.
    bool isDefining() const noexcept { return defining_; }
    void addMethod(std::unique_ptr<HostMethodInfo> info);
    void closeDefinition();
    std::vector<PropertyRecord> properties;

    // Makes an instance with its native object.
    std::shared_ptr<Instance> makeInstance();
    const std::set<Instance*>& instances() const noexcept { return living_; }

private:
    friend class Instance;

    const Name* name_;
    const Module* module_;
    std::unique_ptr<HostClassInfo> info_;
    std::vector<MethodRecord> methods_;
    bool defining_ = true;
    std::set<Instance*> living_;
};

enum class ListenerKind { Get, Set };

// Instance is one object of a class, referred to by any number of values.
//
// Invariants: it lives until destroy() or its destructor, whichever is first;
//   only a living instance has a class and a native object.
// Ownership: the class made the native object and destroys it, once.
class Instance {
public:
    Instance(ClassRecord& instanceClass, void* native);
    Instance(const Instance&) = delete;
    Instance& operator=(const Instance&) = delete;
    ~Instance() { destroy(); }

    bool isLiving() const noexcept { return class_ != nullptr; }
    // Null once destroyed.
    ClassRecord* instanceClass() const noexcept { return class_; }
    void* native() const noexcept { return native_; }

    void destroy() noexcept;

    struct Listener {
        const PropertyRecord* property;
        ListenerKind kind;
        std::function<void()> notify;
    };
    std::vector<Listener> listeners;
    // Whether custom load gave the native object back.
    bool restored = false;

private:
    ClassRecord* class_;
    void* native_;
};

}  // namespace tessel::embedded
