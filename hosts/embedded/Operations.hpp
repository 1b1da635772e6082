#pragma once

#include "binding/HostInterface.hpp"
#include "hosts/embedded/Errors.hpp"
#include "hosts/embedded/Registry.hpp"
#include "hosts/embedded/Value.hpp"

namespace tessel::embedded {

// Operations is the embedded host as a plug-in sees it.
//
// Every array that a plug-in passes is an Array. Arrays of another class than
// an operation needs, and indices outside an array, are host errors: nothing is
// ever read outside an array's elements.
class Operations final : public HostInterface {
public:
    Operations(Registry& registry, const Errors& errors, bool alternativeMode)
        : registry_(registry),
          errors_(errors),
          alternativeMode_(alternativeMode) {}

    std::size_t hostNumel(const HostArray* array) override;
    std::string hostGetString(const HostArray* text) override;
    std::u16string hostGetUString(const HostArray* text) override;
    bool hostIsCell(const HostArray* array) override;
    const HostArray* hostCellElement(const HostArray* cell,
                                     std::size_t index) override;
    void hostRealElements(const HostArray* numeric,
                          std::vector<double>& out) override;
    void hostRealElements(const HostArray* numeric,
                          std::vector<std::uint8_t>& out) override;
    const double* hostDoubleData(const HostArray* numeric,
                                 std::size_t count) override;
    bool hostIsStruct(const HostArray* array) override;
    bool hostHasField(const HostArray* structure, const char* field) override;
    const HostArray* hostFieldElement(const HostArray* structure,
                                      const char* field,
                                      std::size_t index) override;

    HostArray* hostCreateCharArray(std::u16string_view text) override;
    HostArray* hostCreateCell(std::size_t rows, std::size_t columns) override;
    void hostSetCell(HostArray* cell, std::size_t index,
                     HostArray* element) override;
    HostArray* hostCreateNumeric(std::size_t rows, std::size_t columns,
                                 HostNumericClass numericClass) override;
    void* hostNumericData(HostArray* numeric) noexcept override;
    HostArray* hostCreateLogicalScalar(bool value) override;
    void hostReleaseArray(HostArray* array) noexcept override;

    void* hostNativeObject(const HostArray* instance,
                           const char* className) override;
    void hostSetNativeObject(HostArray* instance, const char* className,
                             void* native) override;
    HostArray* hostConvert(const HostSavedValue* saved,
                           const char* typeName) override;

    void hostErrorTooManyOutputs() override;
    void hostErrorTooManyInputs() override;
    void hostErrorTooFewInputs() override;
    void hostErrorOutOfMemory() override;
    void HostError(std::string_view identifier,
                   std::span<const HostMessageArgument> arguments) override;

    HostName hostInternName(const char* text) override;
    HostPackage* hostGlobalPackage(const char* name) override;
    HostPackage* hostSubPackage(HostPackage* package,
                                const char* name) override;
    const char* hostPackageFullName(const HostPackage* package) override;
    HostClass* hostFindClass(HostName fullName) override;
    void hostRegisterClass(HostPackage* package,
                           std::unique_ptr<HostClassInfo> info) override;
    void hostAddMethod(HostClass* definedClass,
                       std::unique_ptr<HostMethodInfo> method) override;
    void hostAddProperty(HostClass* definedClass,
                         const HostPropertyInfo& property) override;
    bool hostAlternativeMode() override { return alternativeMode_; }

    HostSignature* hostCreateSignature() override;
    void hostReleaseSignature(HostSignature* signature) noexcept override;
    void hostSignatureAddInput(HostSignature* signature, const char* typeName,
                               const char* name) override;
    void hostSignatureAddInstanceInput(HostSignature* signature,
                                       const char* className) override;
    void hostSignatureAddOutput(HostSignature* signature, const char* typeName,
                                const char* name) override;
    void hostSignatureMarkOptionalTail(HostSignature* signature) override;
    void hostSignatureMarkOutputs(HostSignature* signature) override;

private:
    BorrowedValue checked(const HostArray* array, ValueClass needed) const;
    void checkIndex(std::size_t index, std::size_t count) const;
    Instance& livingInstance(const HostArray* array,
                             const char* className) const;
    ClassRecord& classBeingDefined(HostClass* definedClass) const;
    template <class Make>
    HostArray* created(Make make) const;

    Registry& registry_;
    const Errors& errors_;
    bool alternativeMode_;
};

// A Value on its way to custom load.
class SavedValue final : public HostSavedValue {
public:
    explicit SavedValue(const Value& savedForm) : value(savedForm) {}
    const Value& value;
};

// Whether a value may be passed where a signature or property declares a type.
bool accepts(std::string_view typeName, const Value& value);

// The type of a value, as accepts understands it. Valid as long as the value
// and its class.
std::string_view typeNameOf(const Value& value);

}  // namespace tessel::embedded
