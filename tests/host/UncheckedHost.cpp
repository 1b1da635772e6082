#include "tests/host/UncheckedHost.hpp"

#include <numeric>
#include <stdexcept>

namespace {

tessel::HostGate processGate{tessel::hostInterfaceVersion, nullptr};

}  // namespace

const tessel::HostGate* VXHostInterface(std::uint32_t /*wantedVersion*/) {
    return &processGate;
}

namespace unchecked {

using tessel::HostArray;
using tessel::HostNumericClass;

namespace {

const Box& boxOf(const HostArray* array) {
    return *static_cast<const Box*>(array);
}
Box& boxOf(HostArray* array) { return *static_cast<Box*>(array); }

}  // namespace

Host::Host() { gate() = {tessel::hostInterfaceVersion, this}; }

Host::~Host() {
    registered.reset();
    gate() = {tessel::hostInterfaceVersion, nullptr};
}

tessel::HostGate& Host::gate() { return processGate; }

tessel::HostMethodInfo& Host::method(const std::string& name) {
    for (const auto& method : registered->methods)
        if (method->name() == name) return *method;
    throw std::out_of_range(name);
}

void Host::raise(const std::string& error, bool returns) {
    errors.push_back(error);
    if (!returns) throw Raised(error);
}

// ---- Making arrays ----

Array Host::box(std::size_t rows, std::size_t columns) {
    auto made = std::make_unique<Box>(arrays);
    made->dimensions = {rows, columns};
    return made;
}

Array Host::text(const std::u16string& characters) {
    Array made = box(1, characters.size());
    made->text = characters;
    return made;
}

Array Host::cell(std::vector<Array> elements) {
    Array made = box(elements.size(), 1);
    made->isCell = true;
    made->elements = std::move(elements);
    return made;
}

Array Host::texts(const std::vector<std::u16string>& rows) {
    std::vector<Array> elements;
    for (const std::u16string& row : rows) elements.push_back(text(row));
    return cell(std::move(elements));
}

Array Host::column(const std::vector<double>& values) {
    Array made = box(values.size(), 1);
    made->numbers = values;
    return made;
}

Array Host::byteColumn(const std::vector<std::uint8_t>& values) {
    Array made = box(values.size(), 1);
    made->bytes = values;
    return made;
}

Array Host::structure() {
    Array made = box(1, 1);
    made->isStruct = true;
    return made;
}

// --- Arrays as the plug-in sees them -----------------------------------------

std::size_t Host::hostNumel(const HostArray* array) {
    const auto& dimensions = boxOf(array).dimensions;
    return std::accumulate(dimensions.begin(), dimensions.end(), std::size_t{1},
                           std::multiplies<>());
}

std::string Host::hostGetString(const HostArray* array) {
    const std::u16string& text = boxOf(array).text;
    return {text.begin(), text.end()};  // mode words are plain letters
}

std::u16string Host::hostGetUString(const HostArray* array) {
    return boxOf(array).text;
}

bool Host::hostIsCell(const HostArray* array) { return boxOf(array).isCell; }

const HostArray* Host::hostCellElement(const HostArray* array,
                                       std::size_t index) {
    return boxOf(array).elements.at(index).get();
}

void Host::hostRealElements(const HostArray* array, std::vector<double>& out) {
    out = boxOf(array).numbers;
}

void Host::hostRealElements(const HostArray* array,
                            std::vector<std::uint8_t>& out) {
    out = boxOf(array).bytes;
}

const double* Host::hostDoubleData(const HostArray* array, std::size_t count) {
    if (boxOf(array).numbers.size() < count) raise("tooFewNumbers", false);
    return boxOf(array).numbers.data();
}

bool Host::hostIsStruct(const HostArray* array) {
    return boxOf(array).isStruct;
}

bool Host::hostHasField(const HostArray* array, const char* field) {
    return boxOf(array).fields.count(field) != 0;
}

const HostArray* Host::hostFieldElement(const HostArray* array,
                                        const char* field,
                                        std::size_t /*index*/) {
    return boxOf(array).fields.at(field).get();
}

HostArray* Host::hostCreateCharArray(std::u16string_view characters) {
    if (refuses()) return nullptr;
    return text(std::u16string(characters)).release();
}

HostArray* Host::hostCreateCell(std::size_t rows, std::size_t columns) {
    if (refuses()) return nullptr;
    Array made = box(rows, columns);
    made->isCell = true;
    for (std::size_t i = 0; i < rows * columns; ++i)
        made->elements.push_back(box(0, 0));
    return made.release();
}

void Host::hostSetCell(HostArray* array, std::size_t index,
                       HostArray* element) {
    Array taken(&boxOf(element));
    boxOf(array).elements.at(index) = std::move(taken);
}

HostArray* Host::hostCreateNumeric(std::size_t rows, std::size_t columns,
                                   HostNumericClass numericClass) {
    if (refuses()) return nullptr;
    Array made = box(rows, columns);
    if (numericClass == HostNumericClass::Double)
        made->numbers.resize(rows * columns, -1);
    else
        made->bytes.resize(rows * columns, 0xEE);
    return made.release();
}

void* Host::hostNumericData(HostArray* array) noexcept {
    Box& numeric = boxOf(array);
    if (!numeric.numbers.empty()) return numeric.numbers.data();
    return numeric.bytes.data();
}

HostArray* Host::hostCreateLogicalScalar(bool value) {
    if (refuses()) return nullptr;
    Array made = box(1, 1);
    made->bytes = {static_cast<std::uint8_t>(value)};
    return made.release();
}

void Host::hostReleaseArray(HostArray* array) noexcept {
    if (array == nullptr) errors.emplace_back("null released");
    delete static_cast<Box*>(array);
}

// ---- Instances ----

void* Host::hostNativeObject(const HostArray* instance,
                             const char* /*className*/) {
    ++nativeAsked;
    return boxOf(instance).native;
}

void Host::hostSetNativeObject(HostArray* instance, const char* /*className*/,
                               void* native) {
    ++nativeGiven;
    if (native != boxOf(instance).native) raise("wrongNativeObject", false);
}

HostArray* Host::hostConvert(const tessel::HostSavedValue* saved,
                             const char* typeName) {
    if (refuses()) return nullptr;
    if (std::string(typeName) != "any") raise("wrongConversion", false);
    return static_cast<const Saved*>(saved)->makes().release();
}

// ---- Errors ----

void Host::hostErrorTooManyOutputs() {
    raise("tooManyOutputs", standardErrorsReturn);
}
void Host::hostErrorTooManyInputs() {
    raise("tooManyInputs", standardErrorsReturn);
}
void Host::hostErrorTooFewInputs() {
    raise("tooFewInputs", standardErrorsReturn);
}
void Host::hostErrorOutOfMemory() {
    raise("outOfMemory", standardErrorsReturn);
}

void Host::HostError(std::string_view identifier,
                     std::span<const tessel::HostMessageArgument> arguments) {
    std::string error(identifier);
    for (const auto& argument : arguments)
        error += "(" + std::get<std::string>(argument) + ")";
    raise(error, errorEntryReturns);
}

// ---- Names, packages, classes ----

tessel::HostName Host::hostInternName(const char* name) {
    Name& interned = names_[name];
    interned.text = name;
    return interned.text.empty() ? nullptr : &interned;
}

tessel::HostPackage* Host::hostGlobalPackage(const char* name) {
    packages_[name].fullName = name;
    return &packages_[name];
}

tessel::HostPackage* Host::hostSubPackage(tessel::HostPackage* package,
                                          const char* name) {
    return hostGlobalPackage(
        (static_cast<Package*>(package)->fullName + "." + name).c_str());
}

const char* Host::hostPackageFullName(const tessel::HostPackage* package) {
    return static_cast<const Package*>(package)->fullName.c_str();
}

tessel::HostClass* Host::hostFindClass(tessel::HostName fullName) {
    const std::string& name = static_cast<const Name*>(fullName)->text;
    const bool known =
        name == "velox.io.datastore.internal.fileset.HuffmanPaths";
    return known ? registered.get() : nullptr;
}

void Host::hostRegisterClass(tessel::HostPackage* package,
                             std::unique_ptr<tessel::HostClassInfo> info) {
    if (static_cast<Package*>(package)->fullName !=
        "velox.io.datastore.internal.fileset") {
        raise("wrongPackage", false);
    }
    auto defined = std::make_unique<Class>();
    defined->info = std::move(info);
    defined->info->defineMembers(defined.get());
    registered = std::move(defined);
    ++registrations;
}

void Host::hostAddMethod(tessel::HostClass* definedClass,
                         std::unique_ptr<tessel::HostMethodInfo> info) {
    static_cast<Class*>(definedClass)->methods.push_back(std::move(info));
}

void Host::hostAddProperty(tessel::HostClass* definedClass,
                           const tessel::HostPropertyInfo& property) {
    static_cast<Class*>(definedClass)
        ->properties.push_back({property.name, property.typeName,
                                property.description != nullptr, property});
}

// ---- Signatures ----

tessel::HostSignature* Host::hostCreateSignature() {
    if (refuses()) return nullptr;
    return new Signature(signatures);
}

void Host::hostReleaseSignature(tessel::HostSignature* signature) noexcept {
    delete static_cast<Signature*>(signature);
}

void Host::hostSignatureAddInput(tessel::HostSignature* signature,
                                 const char* typeName, const char* name) {
    static_cast<Signature*>(signature)->calls.push_back(std::string("input ") +
                                                        typeName + " " + name);
}

void Host::hostSignatureAddInstanceInput(tessel::HostSignature* signature,
                                         const char* className) {
    static_cast<Signature*>(signature)->calls.push_back(
        std::string("instance ") + className);
}

void Host::hostSignatureAddOutput(tessel::HostSignature* signature,
                                  const char* typeName, const char* name) {
    static_cast<Signature*>(signature)->calls.push_back(std::string("output ") +
                                                        typeName + " " + name);
}

void Host::hostSignatureMarkOptionalTail(tessel::HostSignature* signature) {
    static_cast<Signature*>(signature)->calls.emplace_back("optional tail");
}

void Host::hostSignatureMarkOutputs(tessel::HostSignature* signature) {
    static_cast<Signature*>(signature)->calls.emplace_back("outputs");
}

}  // namespace unchecked
