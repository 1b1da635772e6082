#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "binding/HostInterface.hpp"

// The least that runs the plug-in: no type checks, no properties, no saving.
// Read it beside docs/host-interface.md.
namespace minimal {

// What this host throws when it raises an error.
class HostError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// The array type of this host. Which of the members holds the elements depends
// on what the array was made as; the others are empty.
struct Array : tessel::HostArray {
    explicit Array(std::size_t elementCount) : count(elementCount) {}

    std::size_t count;
    std::u16string text;                        // char
    std::vector<double> doubles;                // double
    std::vector<std::uint8_t> bytes;            // uint8, logical
    std::vector<std::unique_ptr<Array>> cells;  // cell
    void* native = nullptr;                     // an instance's native object
};

struct Name : tessel::HostOpaque<tessel::HostNameTag> {};

struct Package : tessel::HostPackage {
    std::string path;
};

// This host trusts its callers to pass what the methods declare.
struct Signature : tessel::HostSignature {};

struct Class : tessel::HostClass {
    std::unique_ptr<tessel::HostClassInfo> info;
    std::map<std::string, std::unique_ptr<tessel::HostMethodInfo>> methods;
};

class MinimalHost final : public tessel::HostInterface {
public:
    // The registered class of that full name. Throws HostError.
    Class& classOf(const std::string& fullName);
    // Deletes all descriptors. Call it before the plug-in is unloaded.
    void removeClasses() { classes_.clear(); }

    // ---- Reading arrays ----

    std::size_t hostNumel(const tessel::HostArray* array) override;
    std::string hostGetString(const tessel::HostArray* text) override;
    std::u16string hostGetUString(const tessel::HostArray* text) override;
    bool hostIsCell(const tessel::HostArray* array) override;
    const tessel::HostArray* hostCellElement(const tessel::HostArray* cell,
                                             std::size_t index) override;
    void hostRealElements(const tessel::HostArray* numeric,
                          std::vector<double>& out) override;
    void hostRealElements(const tessel::HostArray* numeric,
                          std::vector<std::uint8_t>& out) override;
    const double* hostDoubleData(const tessel::HostArray* numeric,
                                 std::size_t count) override;
    bool hostIsStruct(const tessel::HostArray* array) override;
    bool hostHasField(const tessel::HostArray* structure,
                      const char* field) override;
    const tessel::HostArray* hostFieldElement(
        const tessel::HostArray* structure, const char* field,
        std::size_t index) override;

    // ---- Creating, filling and releasing arrays ----

    tessel::HostArray* hostCreateCharArray(std::u16string_view text) override;
    tessel::HostArray* hostCreateCell(std::size_t rows,
                                      std::size_t columns) override;
    void hostSetCell(tessel::HostArray* cell, std::size_t index,
                     tessel::HostArray* element) override;
    tessel::HostArray* hostCreateNumeric(
        std::size_t rows, std::size_t columns,
        tessel::HostNumericClass numericClass) override;
    void* hostNumericData(tessel::HostArray* numeric) noexcept override;
    tessel::HostArray* hostCreateLogicalScalar(bool value) override;
    void hostReleaseArray(tessel::HostArray* array) noexcept override;

    // ---- Instances ----

    void* hostNativeObject(const tessel::HostArray* instance,
                           const char* className) override;
    void hostSetNativeObject(tessel::HostArray* instance, const char* className,
                             void* native) override;
    tessel::HostArray* hostConvert(const tessel::HostSavedValue* saved,
                                   const char* typeName) override;

    // ---- Errors ----

    void hostErrorTooManyOutputs() override;
    void hostErrorTooManyInputs() override;
    void hostErrorTooFewInputs() override;
    void hostErrorOutOfMemory() override;
    void HostError(
        std::string_view identifier,
        std::span<const tessel::HostMessageArgument> arguments) override;

    // ---- Names, packages, classes ----

    tessel::HostName hostInternName(const char* text) override;
    tessel::HostPackage* hostGlobalPackage(const char* name) override;
    tessel::HostPackage* hostSubPackage(tessel::HostPackage* package,
                                        const char* name) override;
    const char* hostPackageFullName(
        const tessel::HostPackage* package) override;
    tessel::HostClass* hostFindClass(tessel::HostName fullName) override;
    void hostRegisterClass(
        tessel::HostPackage* package,
        std::unique_ptr<tessel::HostClassInfo> info) override;
    void hostAddMethod(tessel::HostClass* definedClass,
                       std::unique_ptr<tessel::HostMethodInfo> method) override;
    void hostAddProperty(tessel::HostClass* definedClass,
                         const tessel::HostPropertyInfo& property) override;
    bool hostAlternativeMode() override { return false; }

    // ---- Signatures ----

    tessel::HostSignature* hostCreateSignature() override;
    void hostReleaseSignature(
        tessel::HostSignature* signature) noexcept override;
    void hostSignatureAddInput(tessel::HostSignature* /*signature*/,
                               const char* /*typeName*/,
                               const char* /*name*/) override {}
    void hostSignatureAddInstanceInput(tessel::HostSignature* /*signature*/,
                                       const char* /*className*/) override {}
    void hostSignatureAddOutput(tessel::HostSignature* /*signature*/,
                                const char* /*typeName*/,
                                const char* /*name*/) override {}
    void hostSignatureMarkOptionalTail(
        tessel::HostSignature* /*signature*/) override {}
    void hostSignatureMarkOutputs(
        tessel::HostSignature* /*signature*/) override {}

private:
    std::map<std::string, Name> names_;
    std::map<std::string, Package> packages_;
    std::map<tessel::HostName, Class> classes_;
};

// The host of this process, which VXHostInterface answers.
MinimalHost& theHost();

}  // namespace minimal
