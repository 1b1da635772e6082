#include "hosts/embedded/Operations.hpp"

#include <new>
#include <stdexcept>
#include <utility>

#include "hosts/embedded/Text.hpp"

namespace tessel::embedded {

namespace {

Signature& signatureOf(HostSignature* signature) {
    return *static_cast<Signature*>(signature);
}

HostMessageArgument number(std::size_t count) {
    return static_cast<std::int64_t>(count);
}

}  // namespace

// ---- Checks ----

BorrowedValue Operations::checked(const HostArray* array,
                                  ValueClass needed) const {
    BorrowedValue value(array);
    if (value->valueClass() != needed)
        errors_.raiseOwn("wrongClass", {std::string(className(needed)),
                                        std::string(typeNameOf(*value))});
    return value;
}

void Operations::checkIndex(std::size_t index, std::size_t count) const {
    if (index >= count)
        errors_.raiseOwn("indexOutside", {number(index + 1), number(count)});
}

// The first element of an object array, if it lives and is of that class.
Instance& Operations::livingInstance(const HostArray* array,
                                     const char* className) const {
    const BorrowedValue value(array);
    if (value->valueClass() != ValueClass::Object || value->numel() == 0)
        errors_.raiseOwn("notAnInstance", {className});
    Instance& instance = *value->instance(0);
    if (!instance.isLiving()) errors_.raiseOwn("invalidInstance");
    if (instance.instanceClass()->fullName() != className)
        errors_.raiseOwn("notAnInstance", {className});
    return instance;
}

ClassRecord& Operations::classBeingDefined(HostClass* definedClass) const {
    auto& record = *static_cast<ClassRecord*>(definedClass);
    if (!record.isDefining()) errors_.raiseOwn("notDefining");
    return record;
}

bool accepts(std::string_view typeName, const Value& value) {
    return typeName == "any" || typeName == typeNameOf(value);
}

std::string_view typeNameOf(const Value& value) {
    if (value.valueClass() == ValueClass::Object && value.numel() != 0) {
        const ClassRecord* const record = value.instance(0)->instanceClass();
        if (record != nullptr) return record->fullName();
    }
    return className(value.valueClass());
}

// ---- Reading arrays ----

std::size_t Operations::hostNumel(const HostArray* array) {
    return BorrowedValue(array)->numel();
}

std::string Operations::hostGetString(const HostArray* text) {
    return toUtf8(checked(text, ValueClass::Char)->charData());
}

std::u16string Operations::hostGetUString(const HostArray* text) {
    return std::u16string(checked(text, ValueClass::Char)->charData());
}

bool Operations::hostIsCell(const HostArray* array) {
    return BorrowedValue(array)->valueClass() == ValueClass::Cell;
}

const HostArray* Operations::hostCellElement(const HostArray* cell,
                                             std::size_t index) {
    const BorrowedValue value = checked(cell, ValueClass::Cell);
    checkIndex(index, value->numel());
    return value->element(index).array();
}

void Operations::hostRealElements(const HostArray* numeric,
                                  std::vector<double>& out) {
    const BorrowedValue value = checked(numeric, ValueClass::Double);
    const std::vector<double>& data = value->doubleData();
    const std::size_t step = value->isComplex() ? 2 : 1;
    out.clear();
    out.reserve(data.size() / step);
    for (std::size_t i = 0; i < data.size(); i += step) out.push_back(data[i]);
}

void Operations::hostRealElements(const HostArray* numeric,
                                  std::vector<std::uint8_t>& out) {
    out = checked(numeric, ValueClass::Uint8)->byteData();
}

const double* Operations::hostDoubleData(const HostArray* numeric,
                                         std::size_t count) {
    const BorrowedValue value = checked(numeric, ValueClass::Double);
    if (value->isComplex())
        errors_.raiseOwn("wrongClass", {"double", "complex double"});
    if (value->numel() < count)
        errors_.raiseOwn("tooFewElements",
                         {number(count), number(value->numel())});
    return value->doubleData().data();
}

bool Operations::hostIsStruct(const HostArray* array) {
    return BorrowedValue(array)->valueClass() == ValueClass::Struct;
}

bool Operations::hostHasField(const HostArray* structure, const char* field) {
    return checked(structure, ValueClass::Struct)->hasField(field);
}

const HostArray* Operations::hostFieldElement(const HostArray* structure,
                                              const char* field,
                                              std::size_t index) {
    const BorrowedValue value = checked(structure, ValueClass::Struct);
    if (!value->hasField(field)) errors_.raiseOwn("fieldMissing", {field});
    checkIndex(index, value->numel());
    return value->field(field, index).array();
}

// ---- Creating, filling and releasing arrays ----

template <class Make>
HostArray* Operations::created(Make make) const {
    try {
        return make().release();
    } catch (const std::bad_alloc&) {     // both are raised below
    } catch (const std::length_error&) {  // more than can be addressed
    }
    errors_.raiseOwn("outOfMemory");
}

HostArray* Operations::hostCreateCharArray(std::u16string_view text) {
    return created([&] { return Value::text(text); });
}

HostArray* Operations::hostCreateCell(std::size_t rows, std::size_t columns) {
    return created([&] { return Value::cell(rows, columns); });
}

void Operations::hostSetCell(HostArray* cell, std::size_t index,
                             HostArray* element) {
    Value taken = Value::adopt(element);
    checked(cell, ValueClass::Cell);
    auto& cells = static_cast<Value::Cells&>(*cell);
    checkIndex(index, cells.numel());
    if (!cells.isUnique()) errors_.raiseOwn("arrayShared");
    cells.elements()[index] = std::move(taken);
}

HostArray* Operations::hostCreateNumeric(std::size_t rows, std::size_t columns,
                                         HostNumericClass numericClass) {
    const Dimensions dimensions{rows, columns};
    return created([&] {
        const std::size_t count = elementCount(dimensions);
        if (numericClass == HostNumericClass::Double)
            return Value::doubles(dimensions, std::vector<double>(count));
        return Value::bytes(dimensions, std::vector<std::uint8_t>(count));
    });
}

void* Operations::hostNumericData(HostArray* numeric) noexcept {
    return BorrowedValue(numeric).own().ownNumericData();
}

HostArray* Operations::hostCreateLogicalScalar(bool value) {
    return created([&] { return Value::logical(value); });
}

void Operations::hostReleaseArray(HostArray* array) noexcept {
    static_cast<void>(Value::adopt(array));
}

// ---- Instances ----

void* Operations::hostNativeObject(const HostArray* instance,
                                   const char* className) {
    return livingInstance(instance, className).native();
}

void Operations::hostSetNativeObject(HostArray* instance, const char* className,
                                     void* native) {
    Instance& object = livingInstance(instance, className);
    if (object.native() != native)
        errors_.raiseOwn("nativeObjectChanged", {className});
    object.restored = true;
}

HostArray* Operations::hostConvert(const HostSavedValue* saved,
                                   const char* typeName) {
    const Value& value = static_cast<const SavedValue*>(saved)->value;
    if (!accepts(typeName, value))
        errors_.raiseOwn("wrongClass",
                         {typeName, std::string(typeNameOf(value))});
    return created([&] { return value.clone(); });
}

// ---- Errors ----

void Operations::hostErrorTooManyOutputs() {
    errors_.raiseOwn("tooManyOutputs");
}
void Operations::hostErrorTooManyInputs() { errors_.raiseOwn("tooManyInputs"); }
void Operations::hostErrorTooFewInputs() { errors_.raiseOwn("tooFewInputs"); }
void Operations::hostErrorOutOfMemory() { errors_.raiseOwn("outOfMemory"); }

void Operations::HostError(std::string_view identifier,
                           std::span<const HostMessageArgument> arguments) {
    errors_.raise(identifier, arguments);
}

// ---- Names, packages, classes ----

HostName Operations::hostInternName(const char* text) {
    return registry_.names.intern(text);
}

HostPackage* Operations::hostGlobalPackage(const char* name) {
    return registry_.packages.find(name);
}

HostPackage* Operations::hostSubPackage(HostPackage* package,
                                        const char* name) {
    return static_cast<Package*>(package)->find(name);
}

const char* Operations::hostPackageFullName(const HostPackage* package) {
    return static_cast<const Package*>(package)->fullName().c_str();
}

HostClass* Operations::hostFindClass(HostName fullName) {
    return registry_.find(static_cast<const Name*>(fullName));
}

void Operations::hostRegisterClass(HostPackage* package,
                                   std::unique_ptr<HostClassInfo> info) {
    registry_.define(*static_cast<Package*>(package), std::move(info));
}

void Operations::hostAddMethod(HostClass* definedClass,
                               std::unique_ptr<HostMethodInfo> method) {
    classBeingDefined(definedClass).addMethod(std::move(method));
}

void Operations::hostAddProperty(HostClass* definedClass,
                                 const HostPropertyInfo& property) {
    const char* const description = property.description;
    classBeingDefined(definedClass)
        .properties.push_back(
            {registry_.names.intern(property.name),
             description == nullptr ? "" : description, property.typeName,
             property.attributeBits, property.getAccess, property.setAccess,
             property.getter, property.setter, property.disposer});
}

// ---- Signatures ----

HostSignature* Operations::hostCreateSignature() {
    return new (std::nothrow) Signature();
}

void Operations::hostReleaseSignature(HostSignature* signature) noexcept {
    delete static_cast<Signature*>(signature);
}

void Operations::hostSignatureAddInput(HostSignature* signature,
                                       const char* typeName, const char* name) {
    signatureOf(signature).inputs.push_back({typeName, name});
}

void Operations::hostSignatureAddInstanceInput(HostSignature* signature,
                                               const char* className) {
    signatureOf(signature).inputs.push_back({className, "instance"});
}

void Operations::hostSignatureAddOutput(HostSignature* signature,
                                        const char* typeName,
                                        const char* name) {
    signatureOf(signature).outputs.push_back({typeName, name});
}

void Operations::hostSignatureMarkOptionalTail(HostSignature* signature) {
    signatureOf(signature).optionalTail = true;
}

void Operations::hostSignatureMarkOutputs(HostSignature* signature) {
    signatureOf(signature).fewerOutputs = true;
}

}  // namespace tessel::embedded
