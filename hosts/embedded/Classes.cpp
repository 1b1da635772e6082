#include "hosts/embedded/Classes.hpp"

#include <algorithm>
#include <utility>

namespace tessel::embedded {

namespace {

MethodKind kindOf(const HostMethodInfo& method, const HostClassInfo& owner) {
    if (std::string_view(method.name()) == owner.className())
        return MethodKind::Constructor;
    if (method.isAbstract()) return MethodKind::None;
    return method.isStatic() ? MethodKind::Static : MethodKind::OfInstances;
}

}  // namespace

bool PropertyRecord::isSaved() const noexcept {
    constexpr std::uint32_t unsaved =
        attributes::isAbstract | attributes::isTransient |
        attributes::isStatic | attributes::isDependent;
    return (attributeBits & unsaved) == 0;
}

bool PropertyRecord::isCopied() const noexcept {
    constexpr std::uint32_t uncopied =
        attributes::isAbstract | attributes::isStatic;
    return has(attributes::copiedWithInstance) &&
           (attributeBits & uncopied) == 0;
}

ClassRecord::ClassRecord(const Name* name, const Module* module,
                         std::unique_ptr<HostClassInfo> info)
    : name_(name), module_(module), info_(std::move(info)) {}

ClassRecord::~ClassRecord() {
    while (!methods_.empty()) methods_.pop_back();
}

void ClassRecord::addMethod(std::unique_ptr<HostMethodInfo> info) {
    std::string name = info->name();
    methods_.push_back({std::move(name), std::move(info)});
}

void ClassRecord::closeDefinition() {
    defining_ = false;
    for (MethodRecord& method : methods_) {
        method.kind = kindOf(*method.info, *info_);
        method.access = method.info->access();
        method.signature =
            static_cast<const Signature*>(method.info->signature());
    }
}

const MethodRecord* ClassRecord::findMethod(
    std::string_view method) const noexcept {
    const auto found = std::ranges::find(methods_, method, &MethodRecord::name);
    return found == methods_.end() ? nullptr : &*found;
}

const MethodRecord* ClassRecord::constructor() const noexcept {
    const auto found = std::ranges::find(methods_, MethodKind::Constructor,
                                         &MethodRecord::kind);
    return found == methods_.end() ? nullptr : &*found;
}

const PropertyRecord* ClassRecord::findProperty(
    std::string_view property) const {
    const auto found = std::find_if(
        properties.begin(), properties.end(),
        [&](const PropertyRecord& p) { return p.name->str() == property; });
    return found == properties.end() ? nullptr : &*found;
}

std::shared_ptr<Instance> ClassRecord::makeInstance() {
    std::unique_ptr<void, std::function<void(void*)>> native(
        info_->createNativeObject(),
        [this](void* made) { info_->destroyNativeObject(made); });
    auto instance = std::make_shared<Instance>(*this, native.get());
    static_cast<void>(native.release());
    return instance;
}

Instance::Instance(ClassRecord& instanceClass, void* native)
    : class_(&instanceClass), native_(native) {
    class_->living_.insert(this);
}

void Instance::destroy() noexcept {
    if (class_ == nullptr) return;
    ClassRecord* const formerClass = std::exchange(class_, nullptr);
    formerClass->living_.erase(this);
    listeners.clear();
    formerClass->info_->destroyNativeObject(std::exchange(native_, nullptr));
}

}  // namespace tessel::embedded
