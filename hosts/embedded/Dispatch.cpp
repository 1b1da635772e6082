#include "hosts/embedded/Dispatch.hpp"

#include <algorithm>
#include <memory>
#include <utility>

#include "hosts/embedded/Operations.hpp"
#include "hosts/embedded/SmallArray.hpp"

namespace tessel::embedded {

namespace {

std::size_t asSize(std::int32_t count) {
    return static_cast<std::size_t>(std::max(count, 0));
}

void notify(const Instance& instance, const PropertyRecord& property,
            ListenerKind kind) {
    const auto listeners = instance.listeners;  // they may add some
    for (const Instance::Listener& listener : listeners)
        if (listener.property == &property && listener.kind == kind)
            listener.notify();
}

}  // namespace

// The inputs of one call, the instance first if there is one; all borrowed.
class Dispatch::Inputs {
public:
    Inputs(const Value* instance, std::span<const Value* const> inputs)
        : values_(inputs.size() + (instance == nullptr ? 0 : 1)),
          arrays_(values_.size()) {
        const Value** next = values_.data();
        if (instance != nullptr) *next++ = instance;
        std::ranges::copy(inputs, next);
        for (std::size_t i = 0; i < size(); ++i)
            arrays_[i] = values_[i]->array();
    }

    std::size_t size() const noexcept { return values_.size(); }
    const Value& operator[](std::size_t i) const { return *values_[i]; }
    const HostArray* const* arrays() const noexcept { return arrays_.data(); }

private:
    SmallArray<const Value*, 6> values_;
    SmallArray<const HostArray*, 6> arrays_;
};

// The output slots of one call. Owns what the method puts into them, but not
// the instance that a constructor finds in the first.
class Dispatch::OutputSlots {
public:
    OutputSlots(std::size_t count, HostArray* newInstance)
        : slots_(std::max<std::size_t>(count, 1)), newInstance_(newInstance) {
        slots_[0] = newInstance;
    }
    OutputSlots(const OutputSlots&) = delete;
    OutputSlots& operator=(const OutputSlots&) = delete;
    ~OutputSlots() {
        for (std::size_t i = 0; i < slots_.size(); ++i)
            if (slots_[i] != newInstance_) static_cast<void>(take(i));
    }

    HostArray** data() noexcept { return slots_.data(); }
    bool isFilled(std::size_t i) const { return slots_[i] != nullptr; }
    Value take(std::size_t i) {
        return Value::adopt(std::exchange(slots_[i], nullptr));
    }

private:
    SmallArray<HostArray*, 4> slots_;
    HostArray* newInstance_;
};

void Dispatch::checkCounts(const Signature& signature, std::size_t inputCount,
                           std::int32_t requested) const {
    const std::size_t outputCount = asSize(requested);
    const std::size_t maxOutputs = signature.outputs.size();
    if (outputCount > maxOutputs) errors_.raiseOwn("tooManyOutputs");
    if (outputCount != 0 && outputCount < maxOutputs &&
        !signature.fewerOutputs && !signature.optionalTail)
        errors_.raiseOwn("tooFewOutputs");
    if (inputCount > signature.inputs.size()) errors_.raiseOwn("tooManyInputs");
    if (inputCount < signature.inputs.size() && !signature.optionalTail)
        errors_.raiseOwn("tooFewInputs");
}

void Dispatch::checkTypes(const Signature& signature,
                          const Inputs& inputs) const {
    for (std::size_t i = 0; i < inputs.size(); ++i) {
        const DeclaredArgument& declared = signature.inputs[i];
        if (!accepts(declared.typeName, inputs[i]))
            errors_.raiseOwn("wrongType", {declared.name, declared.typeName,
                                           std::string(typeNameOf(inputs[i]))});
    }
}

void Dispatch::run(const MethodRecord& method, OutputSlots& outputs,
                   const Inputs& inputs, std::int32_t requested) const {
    HostFrame frame{requested, outputs.data(),
                    static_cast<std::int32_t>(inputs.size()), inputs.arrays()};
    errors_.guarded(method.name, [&] { method.info->execute(frame); });
}

std::vector<Value> Dispatch::call(const MethodRecord& method,
                                  const Value* instance,
                                  std::span<const Value* const> inputs,
                                  std::int32_t requested) const {
    const Signature& signature = *method.signature;
    const Inputs all(instance, inputs);
    checkCounts(signature, all.size(), requested);
    checkTypes(signature, all);
    OutputSlots outputs(signature.outputs.size(), nullptr);
    const std::size_t wanted = asSize(requested);
    // First: once the method has run, nothing may fail for want of memory.
    std::vector<Value> results;
    results.reserve(std::max<std::size_t>(wanted, 1));
    run(method, outputs, all, requested);
    for (std::size_t i = 0; i < std::max<std::size_t>(wanted, 1); ++i) {
        if (outputs.isFilled(i))
            results.push_back(outputs.take(i));
        else if (i < wanted)
            errors_.raiseOwn("outputNotAssigned",
                             {signature.outputs[i].name, method.name});
    }
    return results;
}

void Dispatch::construct(const MethodRecord& method, Value& instance,
                         std::span<const Value* const> inputs,
                         std::int32_t requested) const {
    const Signature& signature = *method.signature;
    const Inputs all(nullptr, inputs);
    checkCounts(signature, all.size(), requested);
    checkTypes(signature, all);
    OutputSlots outputs(signature.outputs.size(), instance.ownArray());
    run(method, outputs, all, requested);
}

void Dispatch::checkAccess(const PropertyRecord& property, HostAccess access,
                           Caller caller) const {
    if (access != HostAccess::Public && caller == Caller::User)
        errors_.raiseOwn("propertyRestricted", {property.name->str()});
    if (property.has(attributes::isAbstract))
        errors_.raiseOwn("propertyHasNoValue", {property.name->str()});
}

// A listener may have destroyed the instance by now.
void* Dispatch::nativeFor(const Instance& instance,
                          const PropertyRecord& property) const {
    if (!instance.isLiving()) errors_.raiseOwn("invalidInstance");
    return property.has(attributes::isStatic) ? nullptr : instance.native();
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
    if (!result) errors_.raiseOwn("outOfMemory");
    return Value::share(result.get());
}

void Dispatch::set(const Instance& instance, const PropertyRecord& property,
                   const Value& value, Caller caller) const {
    checkAccess(property, property.setAccess, caller);
    if (!accepts(property.typeName, value))
        errors_.raiseOwn("wrongType", {property.name->str(), property.typeName,
                                       std::string(typeNameOf(value))});
    if (property.has(attributes::abortSetWhenUnchanged) &&
        get(instance, property, Caller::Host) == value)
        return;
    errors_.guarded(property.name->str(), [&] {
        property.setter(nativeFor(instance, property), value.array());
    });
    notify(instance, property, ListenerKind::Set);
}

}  // namespace tessel::embedded
