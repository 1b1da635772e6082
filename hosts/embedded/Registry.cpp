#include "hosts/embedded/Registry.hpp"

#include <algorithm>
#include <utility>

namespace tessel::embedded {

ClassRecord* Registry::find(const Name* fullName) const {
    for (const auto& record : classes_)
        if (record->name() == fullName) return record.get();
    return nullptr;
}

ClassRecord& Registry::get(std::string_view fullName) const {
    for (const auto& record : classes_)
        if (record->fullName() == fullName) return *record;
    errors_.raiseOwn("classMissing", {std::string(fullName)});
}

std::vector<ClassRecord*> Registry::all() const {
    std::vector<ClassRecord*> records;
    for (const auto& record : classes_) records.push_back(record.get());
    return records;
}

void Registry::define(Package& package, std::unique_ptr<HostClassInfo> info) {
    const Name* const name =
        names.intern(package.fullName() + "." + info->className());
    if (find(name) != nullptr) errors_.raiseOwn("classExists", {name->str()});
    auto record =
        std::make_unique<ClassRecord>(name, enteringModule, std::move(info));
    record->info().defineMembers(record.get());
    record->closeDefinition();
    classes_.push_back(std::move(record));
}

std::size_t Registry::instanceCount(const Module& module) const {
    std::size_t count = 0;
    for (const auto& record : classes_)
        if (record->module() == &module) count += record->instances().size();
    return count;
}

void Registry::removeClasses(const Module& module) {
    for (ClassRecord* const record : all())
        if (record->module() == &module) remove(*record);
}

void Registry::removeAllClasses() {
    while (!classes_.empty()) remove(*classes_.back());
}

void Registry::remove(ClassRecord& record) {
    while (!record.instances().empty())
        (*record.instances().begin())->destroy();
    std::erase_if(classes_, [&](const auto& c) { return c.get() == &record; });
}

}  // namespace tessel::embedded
