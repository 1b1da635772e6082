#include "hosts/embedded/Classes.hpp"

#include <algorithm>
#include <utility>

namespace tessel::embedded {

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

ClassRecord::ClassRecord(const Name* classFullName,
                         const Module* definingModule,
                         std::unique_ptr<HostClassInfo> classInfo)
    : ownName_(classFullName),
      ownModule_(definingModule),
      descriptor_(std::move(classInfo)) {}

ClassRecord::~ClassRecord() {
    while (!methods.empty()) methods.pop_back();
}

HostMethodInfo* ClassRecord::findMethod(std::string_view method) const {
    for (const auto& candidate : methods) {
        if (candidate->name() == method) return candidate.get();
    }
    return nullptr;
}

HostMethodInfo* ClassRecord::constructor() const {
    return findMethod(descriptor_->className());
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
        descriptor_->createNativeObject(),
        [this](void* made) { descriptor_->destroyNativeObject(made); });
    auto instance = std::make_shared<Instance>(*this, native.get());
    static_cast<void>(native.release());
    return instance;
}

Instance::Instance(ClassRecord& instanceClass, void* nativeObject)
    : owner_(&instanceClass), ownNative_(nativeObject) {
    owner_->living_.insert(this);
}

void Instance::destroy() noexcept {
    if (owner_ == nullptr) return;
    ClassRecord* const formerOwner = std::exchange(owner_, nullptr);
    formerOwner->living_.erase(this);
    listeners.clear();
    formerOwner->descriptor_->destroyNativeObject(
        std::exchange(ownNative_, nullptr));
}

}  // namespace tessel::embedded
