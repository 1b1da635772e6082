#include "hosts/embedded/Dispatch.hpp"

#include <algorithm>
#include <memory>

#include "hosts/embedded/Operations.hpp"

namespace tessel::embedded {

namespace {

const Signature& signatureOf(const HostMethodInfo& method) {
    return *static_cast<const Signature*>(method.signature());
}

std::size_t asSize(std::int32_t count) {
    return static_cast<std::size_t>(std::max(count, 0));
}

void notify(const Instance& instance, const PropertyRecord& property,
            ListenerKind kind) {
    const auto listeners = instance.listeners;  // they may add some
    for (const Instance::Listener& listener : listeners) {
        if (listener.property == &property && listener.kind == kind) {
            listener.notify();
        }
    }
}

void* nativeFor(const Instance& instance, const PropertyRecord& property) {
    return property.has(attributes::isStatic) ? nullptr : instance.native();
}

}  // namespace

// The output slots of one call. Owns what the method puts into them, but not
// the instance that a constructor finds in the first.
class Dispatch::OutputSlots {
public:
    OutputSlots(std::size_t count, Value* newInstance)
        : slots_(std::max<std::size_t>(count, 1)), instance_(newInstance) {
        slots_[0] = instance_;
    }
    OutputSlots(const OutputSlots&) = delete;
    OutputSlots& operator=(const OutputSlots&) = delete;
    ~OutputSlots() {
        for (HostArray* const slot : slots_) {
            if (slot != instance_) delete static_cast<Value*>(slot);
        }
    }

    HostArray** data() noexcept { return slots_.data(); }
    bool isFilled(std::size_t index) const { return slots_[index] != nullptr; }
    Value take(std::size_t index) {
        return std::move(*static_cast<Value*>(slots_[index]));
    }

private:
    std::vector<HostArray*> slots_;
    Value* instance_;
};

void Dispatch::checkCounts(const Signature& signature, std::size_t inputCount,
                           std::int32_t requested) const {
    const std::size_t outputCount = asSize(requested);
    const std::size_t mostOutputs = signature.outputs.size();
    if (outputCount > mostOutputs) errors_.own("tooManyOutputs");
    if (outputCount != 0 && outputCount < mostOutputs &&
        !signature.fewerOutputs && !signature.optionalTail) {
        errors_.own("tooFewOutputs");
    }
    if (inputCount > signature.inputs.size()) errors_.own("tooManyInputs");
    if (inputCount < signature.inputs.size() && !signature.optionalTail) {
        errors_.own("tooFewInputs");
    }
}

void Dispatch::checkTypes(const Signature& signature,
                          std::span<const HostArray* const> inputs) const {
    for (std::size_t i = 0; i < inputs.size(); ++i) {
        const DeclaredArgument& declared = signature.inputs[i];
        const Value& value = *static_cast<const Value*>(inputs[i]);
        if (!accepts(declared.typeName, value)) {
            errors_.own("wrongType",
                        {declared.name, declared.typeName, typeNameOf(value)});
        }
    }
}

void Dispatch::run(HostMethodInfo& method, OutputSlots& outputs,
                   std::span<const HostArray* const> inputs,
                   std::int32_t requested) const {
    HostFrame frame{requested, outputs.data(),
                    static_cast<std::int32_t>(inputs.size()), inputs.data()};
    errors_.guarded(method.name(), [&] { method.execute(frame); });
}

std::vector<Value> Dispatch::call(HostMethodInfo& method,
                                  std::span<const HostArray* const> inputs,
                                  std::int32_t requested) const {
    const Signature& signature = signatureOf(method);
    checkCounts(signature, inputs.size(), requested);
    checkTypes(signature, inputs);
    OutputSlots outputs(signature.outputs.size(), nullptr);
    run(method, outputs, inputs, requested);
    const std::size_t wanted = asSize(requested);
    std::vector<Value> results;
    for (std::size_t i = 0; i < std::max<std::size_t>(wanted, 1); ++i) {
        if (outputs.isFilled(i)) {
            results.push_back(outputs.take(i));
        } else if (i < wanted) {
            errors_.own("outputNotAssigned",
                        {signature.outputs[i].name, method.name()});
        }
    }
    return results;
}

void Dispatch::construct(HostMethodInfo& method, Value& instance,
                         std::span<const HostArray* const> inputs,
                         std::int32_t requested) const {
    const Signature& signature = signatureOf(method);
    checkCounts(signature, inputs.size(), requested);
    checkTypes(signature, inputs);
    OutputSlots outputs(signature.outputs.size(), &instance);
    run(method, outputs, inputs, requested);
}

void Dispatch::checkAccess(const PropertyRecord& property, HostAccess access,
                           Caller caller) const {
    if (access != HostAccess::Public && caller == Caller::User) {
        errors_.own("propertyRestricted", {property.name->str()});
    }
    if (property.has(attributes::isAbstract)) {
        errors_.own("propertyHasNoValue", {property.name->str()});
    }
}

Value Dispatch::get(const Instance& instance, const PropertyRecord& property,
                    Caller caller) const {
    checkAccess(property, property.getAccess, caller);
    notify(instance, property, ListenerKind::Get);
    const std::unique_ptr<HostArray, HostValueDisposer> result(
        errors_.guarded(
            property.name->str(),
            [&] { return property.getter(nativeFor(instance, property)); }),
        property.disposer);
    if (!result) errors_.own("outOfMemory");
    return std::move(*static_cast<Value*>(result.get()));
}

void Dispatch::set(const Instance& instance, const PropertyRecord& property,
                   const Value& value, Caller caller) const {
    checkAccess(property, property.setAccess, caller);
    if (!accepts(property.typeName, value)) {
        errors_.own("wrongType", {property.name->str(), property.typeName,
                                  typeNameOf(value)});
    }
    if (property.has(attributes::abortSetWhenUnchanged) &&
        get(instance, property, Caller::Host) == value) {
        return;
    }
    errors_.guarded(property.name->str(), [&] {
        property.setter(nativeFor(instance, property), &value);
    });
    notify(instance, property, ListenerKind::Set);
}

}  // namespace tessel::embedded
