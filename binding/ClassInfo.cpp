#include "binding/ClassInfo.hpp"

#include <array>
#include <cstdio>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "binding/Conversions.hpp"
#include "binding/Methods.hpp"

namespace tessel::binding {

namespace {

// The host has none of the packages in which the class lives.
class MissingPackageException : public std::exception {
public:
    explicit MissingPackageException(const char* name)
        : text_(std::string("The host has no package '") + name + "'.") {}
    const char* what() const noexcept override { return text_.c_str(); }

private:
    std::string text_;
};

HostPackage* found(HostPackage* package, const char* name) {
    if (package == nullptr) throw MissingPackageException(name);
    return package;
}

HostPackage* filesetPackage() {
    HostInterface& from = host();
    HostPackage* package = found(from.hostGlobalPackage("velox"), "velox");
    for (const char* const name : {"io", "datastore", "internal", "fileset"})
        package = found(from.hostSubPackage(package, name), name);
    return package;
}

HostName fullClassName(const HostPackage* package) {
    const char* const packageName = host().hostPackageFullName(package);
    const std::string prefix =
        packageName == nullptr ? "" : std::string(packageName) + ".";
    return host().hostInternName((prefix + huffmanPathsName).c_str());
}

// A descriptor the host will own; no room for it is the host's error.
template <class Descriptor, class... Arguments>
std::unique_ptr<Descriptor> makeDescriptor(Arguments&&... arguments) {
    std::unique_ptr<Descriptor> made(
        new (std::nothrow) Descriptor(std::forward<Arguments>(arguments)...));
    if (made == nullptr) throw HostAllocationFailure();
    return made;
}

// One argument of a signature.
struct Declared {
    const char* typeName;
    const char* name;
};

OwnedSignature newSignature() {
    OwnedSignature signature(host().hostCreateSignature());
    if (signature == nullptr) throw HostAllocationFailure();
    return signature;
}

OwnedSignature instanceSignature() {
    OwnedSignature signature = newSignature();
    host().hostSignatureAddInstanceInput(signature.get(), huffmanPathsFullName);
    return signature;
}

void addInputs(const OwnedSignature& signature,
               std::initializer_list<Declared> inputs) {
    for (const Declared& input : inputs) {
        host().hostSignatureAddInput(signature.get(), input.typeName,
                                     input.name);
    }
}

void addOutputs(const OwnedSignature& signature,
                std::initializer_list<Declared> outputs) {
    for (const Declared& output : outputs) {
        host().hostSignatureAddOutput(signature.get(), output.typeName,
                                      output.name);
    }
}

template <class Method>
void addMethod(HostClass* definedClass, OwnedSignature signature) {
    host().hostAddMethod(definedClass,
                         makeDescriptor<Method>(std::move(signature)));
}

void addConstructor(HostClass* definedClass) {
    OwnedSignature signature = newSignature();
    addInputs(signature, {{"char", "createFrom"},
                          {"any", "uniqueCharsOrObjectOrFolders"},
                          {"any", "pathTree"},
                          {"any", "frequencies"}});
    host().hostSignatureMarkOptionalTail(signature.get());
    addOutputs(signature, {{huffmanPathsFullName, "instance"}});
    addMethod<HuffmanPaths_Constructor>(definedClass, std::move(signature));
}

void addAddPaths(HostClass* definedClass) {
    OwnedSignature signature = instanceSignature();
    addInputs(signature, {{"cell", "folderpaths"}, {"cell", "files"}});
    addMethod<HuffmanPaths_AddPaths>(definedClass, std::move(signature));
}

void addGetPaths(HostClass* definedClass) {
    OwnedSignature signature = instanceSignature();
    addInputs(signature, {{"double", "partitions"}, {"char", "filesep"}});
    host().hostSignatureMarkOptionalTail(signature.get());
    addOutputs(signature, {{"cell", "paths"}, {"cell", "files"}});
    addMethod<HuffmanPaths_GetPaths>(definedClass, std::move(signature));
}

void addIteration(HostClass* definedClass) {
    OwnedSignature nextPath = instanceSignature();
    addOutputs(nextPath, {{"cell", "path"}});
    addMethod<HuffmanPaths_GetNextPath>(definedClass, std::move(nextPath));

    OwnedSignature hasNext = instanceSignature();
    addOutputs(hasNext, {{"any", "logical scalar"}});
    addMethod<HuffmanPaths_HasNextPath>(definedClass, std::move(hasNext));

    addMethod<HuffmanPaths_ResetPathTree>(definedClass, instanceSignature());
}

void addSerialize(HostClass* definedClass) {
    OwnedSignature signature = instanceSignature();
    addOutputs(signature, {{"char", "uniqueChars"}, {"any", "PathTree"}});
    host().hostSignatureMarkOutputs(signature.get());
    addMethod<HuffmanPaths_Serialize>(definedClass, std::move(signature));
}

HuffmanPathTree& coderAt(void* native) {
    return *static_cast<HuffmanPathTree*>(native);
}

HostArray* getStringTree(void* native) {
    return reportingAllocationFailure(
        [&] { return createText(coderAt(native).getTreeString()).release(); });
}

void setStringTree(void* native, const HostArray* value) {
    coderAt(native).setTreeString(host().hostGetUString(value));
}

HostArray* getFrequencies(void* native) {
    return reportingAllocationFailure(
        [&] { return column(coderAt(native).getFrequencies()).release(); });
}

void setFrequencies(void* native, const HostArray* value) {
    std::vector<double> values = doubles(value);
    coderAt(native).setFrequencies(values);
}

void disposeValue(HostArray* value) {
    if (value != nullptr) host().hostReleaseArray(value);
}

void addProperty(HostClass* definedClass, const char* name,
                 HostPropertyGetter getter, HostPropertySetter setter) {
    constexpr std::uint32_t bits =
        attributes::copiedWithInstance | attributes::isVisible;
    host().hostAddProperty(
        definedClass, {name, nullptr, "any", bits, HostAccess::Public,
                       HostAccess::Restricted, getter, setter, disposeValue});
}

// Restores an instance from a struct that has a field PathTree.
void restore(HostArray* instance, const HostArray* saved) {
    HostInterface& from = host();
    const HostArray* const treeString =
        from.hostFieldElement(saved, "StringTree", 0);
    const HostArray* const pathTree =
        from.hostFieldElement(saved, "PathTree", 0);
    HuffmanPathTree& coder = coderOf(instance);
    if (from.hostNumel(treeString) == 0) return;
    std::vector<std::uint8_t> storedForm = bytes(pathTree);
    coder.deserialize(storedForm, true);
    coder.inflateHuffman(from.hostGetUString(treeString));
    from.hostSetNativeObject(instance, huffmanPathsFullName, &coder);
}

void convertAndRestore(HostArray* instance, const HostSavedValue* saved) {
    const OwnedArray array(host().hostConvert(saved, "any"));
    if (array == nullptr) throw HostAllocationFailure();
    if (host().hostIsStruct(array.get()) &&
        host().hostHasField(array.get(), "PathTree")) {
        restore(instance, array.get());
    }
}

}  // namespace

const char* HuffmanPathsCOSClassInfo::className() const noexcept {
    return huffmanPathsName;
}

void HuffmanPathsCOSClassInfo::defineMembers(HostClass* definedClass) {
    reportingAllocationFailure([&] {
        addConstructor(definedClass);
        addAddPaths(definedClass);
        addGetPaths(definedClass);
        addIteration(definedClass);
        addSerialize(definedClass);
        addProperty(definedClass, "StringTree", getStringTree, setStringTree);
        addProperty(definedClass, "Frequencies", getFrequencies,
                    setFrequencies);
    });
}

void* HuffmanPathsCOSClassInfo::createNativeObject() {
    return new HuffmanPathTree();
}

void HuffmanPathsCOSClassInfo::destroyNativeObject(void* native) noexcept {
    delete static_cast<HuffmanPathTree*>(native);
}

void HuffmanPathsCOSClassInfo::customLoad(HostArray* instance,
                                          const HostSavedValue* saved) {
    try {
        convertAndRestore(instance, saved);
    } catch (...) {
        std::puts("Error while custom loading CompressedFileSet.");
    }
}

HostClass* registerHuffmanPaths() {
    return reportingAllocationFailure([] {
        HostPackage* const package = filesetPackage();
        const HostName name = fullClassName(package);
        if (host().hostFindClass(name) == nullptr) {
            host().hostRegisterClass(
                package, makeDescriptor<HuffmanPathsCOSClassInfo>());
        }
        return host().hostFindClass(name);
    });
}

}  // namespace tessel::binding
