#include "hosts/minimal/MinimalHost.hpp"

#include <new>
#include <utility>

namespace minimal {

using tessel::HostArray;

namespace {

// Every array that the plug-in passes is one that this host made.
const Array& arrayOf(const HostArray* array) {
    return *static_cast<const Array*>(array);
}
Array& arrayOf(HostArray* array) { return *static_cast<Array*>(array); }

}  // namespace

MinimalHost& theHost() {
    static MinimalHost host;
    return host;
}

}  // namespace minimal

const tessel::HostGate* VXHostInterface(std::uint32_t /*wantedVersion*/) {
    static const tessel::HostGate gate{tessel::hostInterfaceVersion,
                                       &minimal::theHost()};
    return &gate;
}

namespace minimal {

Class& MinimalHost::classOf(const std::string& fullName) {
    const auto found = classes_.find(hostInternName(fullName.c_str()));
    if (found == classes_.end()) throw minimal::HostError("no such class");
    return found->second;
}

// ---- Reading arrays ----

std::size_t MinimalHost::hostNumel(const HostArray* array) {
    return arrayOf(array).count;
}

std::string MinimalHost::hostGetString(const HostArray* text) {
    const std::u16string& characters = arrayOf(text).text;
    return {characters.begin(), characters.end()};  // mode words are ASCII
}

std::u16string MinimalHost::hostGetUString(const HostArray* text) {
    return arrayOf(text).text;
}

bool MinimalHost::hostIsCell(const HostArray* array) {
    return !arrayOf(array).cells.empty();
}

const HostArray* MinimalHost::hostCellElement(const HostArray* cell,
                                              std::size_t index) {
    return arrayOf(cell).cells.at(index).get();
}

void MinimalHost::hostRealElements(const HostArray* numeric,
                                   std::vector<double>& out) {
    out = arrayOf(numeric).doubles;
}

void MinimalHost::hostRealElements(const HostArray* numeric,
                                   std::vector<std::uint8_t>& out) {
    out = arrayOf(numeric).bytes;
}

const double* MinimalHost::hostDoubleData(const HostArray* numeric,
                                          std::size_t count) {
    const std::vector<double>& doubles = arrayOf(numeric).doubles;
    if (doubles.size() < count) throw minimal::HostError("too few numbers");
    return doubles.data();
}

// This host saves nothing, so it has no structs.
bool MinimalHost::hostIsStruct(const HostArray* /*array*/) { return false; }

bool MinimalHost::hostHasField(const HostArray* /*structure*/,
                               const char* /*field*/) {
    return false;
}

const HostArray* MinimalHost::hostFieldElement(const HostArray* /*structure*/,
                                               const char* field,
                                               std::size_t /*index*/) {
    throw minimal::HostError(std::string("no field ") + field);
}

// ---- Creating, filling and releasing arrays ----

HostArray* MinimalHost::hostCreateCharArray(std::u16string_view text) {
    auto made = std::make_unique<Array>(text.size());
    made->text = text;
    return made.release();
}

HostArray* MinimalHost::hostCreateCell(std::size_t rows, std::size_t columns) {
    auto made = std::make_unique<Array>(rows * columns);
    for (std::size_t i = 0; i < made->count; ++i)
        made->cells.push_back(std::make_unique<Array>(0));
    return made.release();
}

void MinimalHost::hostSetCell(HostArray* cell, std::size_t index,
                              HostArray* element) {
    std::unique_ptr<Array> taken(&arrayOf(element));
    arrayOf(cell).cells.at(index) = std::move(taken);
}

HostArray* MinimalHost::hostCreateNumeric(
    std::size_t rows, std::size_t columns,
    tessel::HostNumericClass numericClass) {
    auto made = std::make_unique<Array>(rows * columns);
    if (numericClass == tessel::HostNumericClass::Double)
        made->doubles.resize(made->count);
    else
        made->bytes.resize(made->count);
    return made.release();
}

void* MinimalHost::hostNumericData(HostArray* numeric) noexcept {
    Array& array = arrayOf(numeric);
    if (!array.doubles.empty()) return array.doubles.data();
    return array.bytes.data();
}

HostArray* MinimalHost::hostCreateLogicalScalar(bool value) {
    auto made = std::make_unique<Array>(1);
    made->bytes = {static_cast<std::uint8_t>(value)};
    return made.release();
}

void MinimalHost::hostReleaseArray(HostArray* array) noexcept {
    delete &arrayOf(array);
}

// ---- Instances ----

void* MinimalHost::hostNativeObject(const HostArray* instance,
                                    const char* /*className*/) {
    void* const native = arrayOf(instance).native;
    if (native == nullptr) throw minimal::HostError("not an instance");
    return native;
}

void MinimalHost::hostSetNativeObject(HostArray* instance,
                                      const char* /*className*/, void* native) {
    arrayOf(instance).native = native;
}

HostArray* MinimalHost::hostConvert(const tessel::HostSavedValue* /*saved*/,
                                    const char* /*typeName*/) {
    throw minimal::HostError("nothing is saved");
}

// ---- Errors ----

void MinimalHost::hostErrorTooManyOutputs() {
    throw minimal::HostError("too many outputs");
}
void MinimalHost::hostErrorTooManyInputs() {
    throw minimal::HostError("too many inputs");
}
void MinimalHost::hostErrorTooFewInputs() {
    throw minimal::HostError("too few inputs");
}
void MinimalHost::hostErrorOutOfMemory() { throw std::bad_alloc(); }

void MinimalHost::HostError(
    std::string_view identifier,
    std::span<const tessel::HostMessageArgument> arguments) {
    std::string text(identifier);
    for (const tessel::HostMessageArgument& argument : arguments)
        text += " (" + std::get<std::string>(argument) + ")";
    throw minimal::HostError(text);
}

// ---- Names, packages, classes ----

tessel::HostName MinimalHost::hostInternName(const char* text) {
    const std::string name(text);
    return name.empty() ? nullptr : &names_[name];
}

tessel::HostPackage* MinimalHost::hostGlobalPackage(const char* name) {
    Package& package = packages_[name];
    package.path = name;
    return &package;
}

tessel::HostPackage* MinimalHost::hostSubPackage(tessel::HostPackage* package,
                                                 const char* name) {
    const std::string& outer = static_cast<Package*>(package)->path;
    return hostGlobalPackage((outer + "." + name).c_str());
}

const char* MinimalHost::hostPackageFullName(
    const tessel::HostPackage* package) {
    return static_cast<const Package*>(package)->path.c_str();
}

tessel::HostClass* MinimalHost::hostFindClass(tessel::HostName fullName) {
    const auto found = classes_.find(fullName);
    return found == classes_.end() ? nullptr : &found->second;
}

void MinimalHost::hostRegisterClass(
    tessel::HostPackage* package, std::unique_ptr<tessel::HostClassInfo> info) {
    const std::string fullName =
        static_cast<Package*>(package)->path + "." + info->className();
    Class defined;
    defined.info = std::move(info);
    defined.info->defineMembers(&defined);  // if this throws, all is deleted
    classes_.emplace(hostInternName(fullName.c_str()), std::move(defined));
}

void MinimalHost::hostAddMethod(
    tessel::HostClass* definedClass,
    std::unique_ptr<tessel::HostMethodInfo> method) {
    std::string name = method->name();
    static_cast<Class*>(definedClass)->methods[name] = std::move(method);
}

void MinimalHost::hostAddProperty(tessel::HostClass* /*definedClass*/,
                                  const tessel::HostPropertyInfo& /*info*/) {}

// ---- Signatures ----

tessel::HostSignature* MinimalHost::hostCreateSignature() {
    return new Signature;
}

void MinimalHost::hostReleaseSignature(
    tessel::HostSignature* signature) noexcept {
    delete static_cast<Signature*>(signature);
}

}  // namespace minimal
