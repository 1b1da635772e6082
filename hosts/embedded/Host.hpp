#pragma once

#include <array>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "binding/HostInterface.hpp"
#include "hosts/embedded/Classes.hpp"
#include "hosts/embedded/HostException.hpp"
#include "hosts/embedded/Value.hpp"

namespace tessel::embedded {

class Host;

struct HostOptions {
    // The folder of the message catalogue (see MessageCatalogue).
    std::filesystem::path messages;
    // Whether modules register their classes on every entry call.
    bool alternativeMode = false;
    // Dotted names of the packages that modules find.
    std::vector<std::string> packages = {"velox.io.datastore.internal.fileset",
                                         "velox.io.datastore.internal",
                                         "velox.internal", "velox.util"};
};

// What the host adds to a class in its own code, beyond the class's properties.
struct ClassExtension {
    // Makes the instance that copying fills; empty: one without any content.
    std::function<Value(Host&, const Value& instance)> copy;
    // Adds fields to the struct in which an instance is saved; may be empty.
    std::function<void(Host&, const Value& instance, Value& saved)> save;
};

// Host is a host environment inside a program: it loads modules, keeps their
// classes, and lets the program work with instances by class, method and
// property name.
//
// A program that links this library exports VXHostInterface, which leads
// modules to its Host. Link it with qztessel_embedded's own options, which take
// care of that.
// Invariants: at most one Host exists in a process at a time.
// Ownership: owns modules and classes. Values may outlive it; instances do not,
//   they are destroyed with it, and so are those of removed classes.
// Threads: one thread at a time.
// Failures: operations throw HostException.
class Host {
public:
    // Throws CatalogueException, and std::logic_error if there is a Host.
    explicit Host(const HostOptions& options);
    Host(const Host&) = delete;
    Host& operator=(const Host&) = delete;
    ~Host();

    // ---- Modules ----

    // Loads a module file libX.so and calls its entry VXInitialize_libX, or
    // only calls the entry again if the file is loaded already.
    void loadModule(const std::filesystem::path& file);
    // Removes the classes that a loaded module registered; in the alternative
    // mode the next loadModule registers them again. Refused while instances
    // of these classes live.
    void removeClasses(const std::filesystem::path& file);
    // The same, and unloads the module.
    void unloadModule(const std::filesystem::path& file);

    // ---- Classes ----

    // Registers a class of the program itself.
    void defineClass(std::string_view package,
                     std::unique_ptr<HostClassInfo> info);
    void extendClass(std::string fullName, ClassExtension extension);

    bool hasClass(std::string_view fullName) const;
    // Names of what is not hidden, in the order of definition.
    std::vector<std::string> classNames() const;
    std::vector<std::string> methodNames(std::string_view className) const;
    std::vector<std::string> propertyNames(std::string_view className) const;

    // ---- Instances ----

    // Makes an instance and runs the class's constructor, if it has one.
    template <class... Inputs>
    Value construct(std::string_view className, const Inputs&... inputs) {
        const std::array<const Value*, sizeof...(inputs)> list{&inputs...};
        return constructWith(className, list);
    }
    Value constructWith(std::string_view className,
                        std::span<const Value* const> inputs,
                        std::int32_t requested = 1);

    // Calls a method of an instance and returns the requested outputs; when
    // none is requested, what the method assigned to its first output or
    // nothing.
    template <class... Inputs>
    std::vector<Value> call(std::int32_t requested, const Value& instance,
                            std::string_view method, const Inputs&... inputs) {
        const std::array<const Value*, sizeof...(inputs)> list{&inputs...};
        return callWith(requested, instance, method, list);
    }
    std::vector<Value> callWith(std::int32_t requested, const Value& instance,
                                std::string_view method,
                                std::span<const Value* const> inputs);

    // Calls a static method.
    std::vector<Value> callStatic(std::int32_t requested,
                                  std::string_view className,
                                  std::string_view method,
                                  std::span<const Value* const> inputs);

    Value get(const Value& instance, std::string_view property);
    void set(const Value& instance, std::string_view property,
             const Value& value);
    // Called before each get, or after each set, of a property that allows it.
    void listen(const Value& instance, std::string_view property,
                ListenerKind kind, std::function<void()> notify);
    // A struct of the properties that allow inspection.
    Value inspect(const Value& instance);

    // A new instance with the properties that are copied with the instance.
    Value copy(const Value& instance);
    // Failures of properties that only warn when they cannot be copied, one
    // line each.
    const std::vector<std::string>& copyWarnings() const noexcept;

    // A saved form: a struct of the properties that are saved and of what the
    // class's extension adds, or whatever its custom save answers.
    Value save(const Value& instance);
    // A new instance from a saved form: custom load first, then the saved
    // properties.
    Value load(std::string_view className, const Value& saved);
    // Whether custom load restored something into the instance. One that fails
    // does not.
    bool isRestored(const Value& instance) const;

    // Destroys an instance now; values that refer to it become invalid.
    void destroy(const Value& instance);
    bool isValid(const Value& instance) const;

    // What modules see.
    HostInterface& operations() noexcept;

private:
    class State;
    std::unique_ptr<State> state_;
};

}  // namespace tessel::embedded
