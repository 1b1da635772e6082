#include "hosts/embedded/Host.hpp"

#include <map>
#include <stdexcept>
#include <utility>

#include "hosts/embedded/Dispatch.hpp"
#include "hosts/embedded/Errors.hpp"
#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/MessageCatalogue.hpp"
#include "hosts/embedded/Modules.hpp"
#include "hosts/embedded/Operations.hpp"
#include "hosts/embedded/Registry.hpp"

namespace {

// The host of this process, for VXHostInterface. A process has one host, so
// this is the one thing that is global.
// NOLINTNEXTLINE(cppcoreguidelines-avoid-non-const-global-variables)
tessel::HostGate gate{tessel::hostInterfaceVersion, nullptr};

}  // namespace

const tessel::HostGate* VXHostInterface(std::uint32_t /*wantedVersion*/) {
    return &gate;
}

namespace tessel::embedded {

class Host::State {
public:
    explicit State(const HostOptions& options)
        : catalogue(options.messages),
          errors(catalogue),
          registry(errors),
          operations(registry, errors, options.alternativeMode),
          dispatch(errors),
          modules(registry, errors) {
        for (const std::string& package : options.packages)
            registry.packages.add(package);
    }

    // The instance that a value refers to. Raises an error if it is none.
    Instance& instanceOf(const Value& value) const {
        if (value.valueClass() != ValueClass::Object || value.numel() == 0)
            errors.raiseOwn("notAnInstance", {"object"});
        Instance& instance = *value.instance(0);
        if (!instance.isLiving()) errors.raiseOwn("invalidInstance");
        return instance;
    }

    const PropertyRecord& propertyOf(const Instance& instance,
                                     std::string_view name) const {
        const ClassRecord& record = *instance.instanceClass();
        const PropertyRecord* const property = record.findProperty(name);
        if (property == nullptr)
            errors.raiseOwn("propertyMissing",
                            {record.fullName(), std::string(name)});
        return *property;
    }

    // A method that users may call.
    const MethodRecord& methodOf(const ClassRecord& record,
                                 std::string_view name, MethodKind kind) const {
        const MethodRecord* const method = record.findMethod(name);
        if (method == nullptr || method->kind != kind)
            errors.raiseOwn("methodMissing",
                            {record.fullName(), std::string(name)});
        if (method->access != HostAccess::Public)
            errors.raiseOwn("methodRestricted", {std::string(name)});
        return *method;
    }

    Value newInstance(ClassRecord& record) const {
        return errors.guarded(record.fullName(), [&] {
            return Value::objects({1, 1}, {record.makeInstance()});
        });
    }

    const ClassExtension& extensionOf(const ClassRecord& record) const {
        static const ClassExtension none;
        const auto found = extensions.find(record.fullName());
        return found == extensions.end() ? none : found->second;
    }

    void copyProperty(const Instance& from, const Instance& to,
                      const PropertyRecord& property) {
        try {
            dispatch.set(to, property,
                         dispatch.get(from, property, Caller::Host),
                         Caller::Host);
        } catch (const HostException& failure) {
            if (!property.has(attributes::warnOnCopyError)) throw;
            copyWarnings.push_back(property.name->str() + ": " +
                                   failure.what());
        }
    }

    void update(const Instance& instance) const {
        HostClassInfo& info = instance.instanceClass()->info();
        errors.guarded(info.className(),
                       [&] { info.updateInstance(instance.native()); });
    }

    MessageCatalogue catalogue;
    Errors errors;
    Registry registry;
    Operations operations;
    Dispatch dispatch;
    Modules modules;
    std::map<std::string, ClassExtension, std::less<>> extensions;
    std::vector<std::string> copyWarnings;
};

Host::Host(const HostOptions& options) {
    if (gate.host != nullptr)
        throw std::logic_error("This process has a host already.");
    state_ = std::make_unique<State>(options);
    extendClass(filesetClassName, filesetExtension());
    gate.host = &state_->operations;
}

Host::~Host() {
    state_->registry.removeAllClasses();
    state_->modules.unloadAll();
    gate.host = nullptr;
}

// ---- Modules ----

void Host::loadModule(const std::filesystem::path& file) {
    state_->modules.load(file);
}

void Host::removeClasses(const std::filesystem::path& file) {
    state_->modules.removeClasses(file);
}

void Host::unloadModule(const std::filesystem::path& file) {
    state_->modules.unload(file);
}

// ---- Classes ----

void Host::defineClass(std::string_view package,
                       std::unique_ptr<HostClassInfo> info) {
    state_->registry.define(state_->registry.packages.add(package),
                            std::move(info));
}

void Host::extendClass(std::string fullName, ClassExtension extension) {
    state_->extensions.insert_or_assign(std::move(fullName),
                                        std::move(extension));
}

bool Host::hasClass(std::string_view fullName) const {
    return state_->registry.find(state_->registry.names.intern(fullName)) !=
           nullptr;
}

std::vector<std::string> Host::classNames() const {
    std::vector<std::string> names;
    for (const ClassRecord* const record : state_->registry.all())
        if (!record->info().isHidden()) names.push_back(record->fullName());
    return names;
}

std::vector<std::string> Host::methodNames(std::string_view className) const {
    std::vector<std::string> names;
    for (const MethodRecord& method : state_->registry.get(className).methods())
        if (method.info->isVisible()) names.push_back(method.name);
    return names;
}

std::vector<std::string> Host::propertyNames(std::string_view className) const {
    std::vector<std::string> names;
    for (const auto& property : state_->registry.get(className).properties)
        if (property.has(attributes::isVisible))
            names.push_back(property.name->str());
    return names;
}

// ---- Instances ----

Value Host::constructWith(std::string_view className,
                          std::span<const Value* const> inputs,
                          std::int32_t requested) {
    ClassRecord& record = state_->registry.get(className);
    Value instance = state_->newInstance(record);
    if (const MethodRecord* const constructor = record.constructor())
        state_->dispatch.construct(*constructor, instance, inputs, requested);
    else if (!inputs.empty())
        state_->errors.raiseOwn("tooManyInputs");
    return instance;
}

std::vector<Value> Host::callWith(std::int32_t requested, const Value& instance,
                                  std::string_view method,
                                  std::span<const Value* const> inputs) {
    const ClassRecord& record = *state_->instanceOf(instance).instanceClass();
    return state_->dispatch.call(
        state_->methodOf(record, method, MethodKind::OfInstances), &instance,
        inputs, requested);
}

std::vector<Value> Host::callStatic(std::int32_t requested,
                                    std::string_view className,
                                    std::string_view method,
                                    std::span<const Value* const> inputs) {
    const ClassRecord& record = state_->registry.get(className);
    return state_->dispatch.call(
        state_->methodOf(record, method, MethodKind::Static), nullptr, inputs,
        requested);
}

Value Host::get(const Value& instance, std::string_view property) {
    const Instance& object = state_->instanceOf(instance);
    return state_->dispatch.get(object, state_->propertyOf(object, property),
                                Caller::User);
}

void Host::set(const Value& instance, std::string_view property,
               const Value& value) {
    const Instance& object = state_->instanceOf(instance);
    state_->dispatch.set(object, state_->propertyOf(object, property), value,
                         Caller::User);
}

void Host::listen(const Value& instance, std::string_view property,
                  ListenerKind kind, std::function<void()> notify) {
    Instance& object = state_->instanceOf(instance);
    const PropertyRecord& record = state_->propertyOf(object, property);
    const std::uint32_t allowed = kind == ListenerKind::Get
                                      ? attributes::getListenersAllowed
                                      : attributes::setListenersAllowed;
    if (!record.has(allowed))
        state_->errors.raiseOwn("listenerRefused", {std::string(property)});
    object.listeners.push_back({&record, kind, std::move(notify)});
}

Value Host::inspect(const Value& instance) {
    const Instance& object = state_->instanceOf(instance);
    Value shown = Value::structure();
    for (const PropertyRecord& property : object.instanceClass()->properties) {
        if (!property.has(attributes::inspectionAllowed)) continue;
        shown.setField(property.name->str(),
                       state_->dispatch.get(object, property, Caller::User));
    }
    return shown;
}

Value Host::copy(const Value& instance) {
    const Instance& source = state_->instanceOf(instance);
    ClassRecord& record = *source.instanceClass();
    if (!record.info().copiesInstances())
        state_->errors.raiseOwn("notCopyable", {record.fullName()});
    const ClassExtension& extension = state_->extensionOf(record);
    Value copied = extension.copy ? extension.copy(*this, instance)
                                  : state_->newInstance(record);
    const Instance& target = state_->instanceOf(copied);
    for (const PropertyRecord& property : record.properties)
        if (property.isCopied()) state_->copyProperty(source, target, property);
    state_->update(target);
    return copied;
}

const std::vector<std::string>& Host::copyWarnings() const noexcept {
    return state_->copyWarnings;
}

Value Host::save(const Value& instance) {
    const Instance& object = state_->instanceOf(instance);
    const ClassRecord& record = *object.instanceClass();
    if (!record.info().savesInstances())
        state_->errors.raiseOwn("notSavable", {record.fullName()});
    HostArray* const custom = state_->errors.guarded(record.fullName(), [&] {
        return record.info().customSave(instance.array());
    });
    if (custom != nullptr) return Value::adopt(custom);
    Value saved = Value::structure();
    for (const PropertyRecord& property : record.properties) {
        if (!property.isSaved()) continue;
        saved.setField(property.name->str(),
                       state_->dispatch.get(object, property, Caller::Host));
    }
    const ClassExtension& extension = state_->extensionOf(record);
    if (extension.save) extension.save(*this, instance, saved);
    return saved;
}

Value Host::load(std::string_view className, const Value& saved) {
    ClassRecord& record = state_->registry.get(className);
    if (!record.info().savesInstances())
        state_->errors.raiseOwn("notSavable", {record.fullName()});
    Value loaded = state_->newInstance(record);
    const SavedValue savedForm(saved);
    state_->errors.guarded(record.fullName(), [&] {
        record.info().customLoad(loaded.ownArray(), &savedForm);
    });
    const Instance& object = state_->instanceOf(loaded);
    const bool hasFields =
        saved.valueClass() == ValueClass::Struct && saved.numel() != 0;
    for (const PropertyRecord& property : record.properties) {
        const std::string& name = property.name->str();
        if (hasFields && property.isSaved() && saved.hasField(name))
            state_->dispatch.set(object, property, saved.field(name),
                                 Caller::Host);
    }
    state_->update(object);
    return loaded;
}

bool Host::isRestored(const Value& instance) const {
    return state_->instanceOf(instance).restored;
}

void Host::destroy(const Value& instance) {
    state_->instanceOf(instance).destroy();
}

bool Host::isValid(const Value& instance) const {
    return instance.valueClass() == ValueClass::Object &&
           instance.numel() != 0 && instance.instance(0)->isLiving();
}

HostInterface& Host::operations() noexcept { return state_->operations; }

}  // namespace tessel::embedded
