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

// What a method declares. Of the counts below the declared ones, no output at
// all is always allowed (a call whose result nobody takes). Everything else
// takes a mark: with the optional tail, inputs may be left out from the end,
// and the method itself checks the number of inputs and outputs that remain;
// with the outputs mark, fewer outputs may be requested.
class Signature final : public HostSignature {
public:
    std::vector<DeclaredArgument> inputs;
    std::vector<DeclaredArgument> outputs;
    bool optionalTail = false;
    bool fewerOutputs = false;
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
// Ownership: owns the descriptors and deletes them in the reverse order of
//   their coming, the class's own last. Instances are their holders'.
// Invariants: there are no living instances when it goes.
class ClassRecord final : public HostClass {
public:
    ClassRecord(const Name* classFullName, const Module* definingModule,
                std::unique_ptr<HostClassInfo> classInfo);
    ClassRecord(const ClassRecord&) = delete;
    ClassRecord& operator=(const ClassRecord&) = delete;
    ~ClassRecord();

    const std::string& fullName() const noexcept { return ownName_->str(); }
    const Name* name() const noexcept { return ownName_; }
    // The module whose entry was running at registration, or null.
    const Module* module() const noexcept { return ownModule_; }
    HostClassInfo& info() const noexcept { return *descriptor_; }

    // Null if there is none of that name.
    HostMethodInfo* findMethod(std::string_view method) const;
    // The method of the class's own name.
    HostMethodInfo* constructor() const;
    const PropertyRecord* findProperty(std::string_view property) const;

    // Members, open while the class is being defined.
    bool defining = true;
    std::vector<std::unique_ptr<HostMethodInfo>> methods;
    std::vector<PropertyRecord> properties;

    // Makes an instance with its native object.
    std::shared_ptr<Instance> makeInstance();
    const std::set<Instance*>& instances() const noexcept { return living_; }

private:
    friend class Instance;

    const Name* ownName_;
    const Module* ownModule_;
    std::unique_ptr<HostClassInfo> descriptor_;
    std::set<Instance*> living_;
};

enum class ListenerKind { Get, Set };

// Instance is one object of a class, referred to by any number of values.
//
// Invariants: living from its making until destroy() or its end, whichever is
//   first; only a living instance has a class and a native object.
// Ownership: the class made the native object and destroys it, once.
class Instance {
public:
    Instance(ClassRecord& instanceClass, void* nativeObject);
    Instance(const Instance&) = delete;
    Instance& operator=(const Instance&) = delete;
    ~Instance() { destroy(); }

    bool isLiving() const noexcept { return owner_ != nullptr; }
    // Null once destroyed.
    ClassRecord* instanceClass() const noexcept { return owner_; }
    void* native() const noexcept { return ownNative_; }

    void destroy() noexcept;

    struct Listener {
        const PropertyRecord* property;
        ListenerKind kind;
        std::function<void()> notify;
    };
    std::vector<Listener> listeners;

private:
    ClassRecord* owner_;
    void* ownNative_;
};

}  // namespace tessel::embedded
