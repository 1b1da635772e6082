#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "binding/HostInterface.hpp"

// A second host, unlike the embedded one: it checks nothing, runs in the
// alternative mode, answers null when it has no memory, may return from raising
// errors, and counts everything that it hands out.
namespace unchecked {

// Counts those of a kind that are alive.
class Counted {
public:
    explicit Counted(long& alive) : alive_(alive) { ++alive_; }
    Counted(const Counted&) = delete;
    Counted& operator=(const Counted&) = delete;
    ~Counted() { --alive_; }

private:
    long& alive_;
};

// An array of any class; which of the parts counts is up to its user.
class Box final : public tessel::HostArray {
public:
    explicit Box(long& alive) : counted_(alive) {}

    std::vector<std::size_t> dimensions = {0, 0};
    bool isCell = false;
    bool isStruct = false;
    std::u16string text;
    std::vector<double> numbers;
    std::vector<std::uint8_t> bytes;
    std::vector<std::unique_ptr<Box>> elements;
    std::map<std::string, std::unique_ptr<Box>> fields;
    void* native = nullptr;

private:
    Counted counted_;
};

using Array = std::unique_ptr<Box>;

// A value before conversion; `makes` is called by the conversion.
class Saved final : public tessel::HostSavedValue {
public:
    std::function<Array()> makes;
};

class Signature final : public tessel::HostSignature {
public:
    explicit Signature(long& alive) : counted_(alive) {}
    std::vector<std::string> calls;

private:
    Counted counted_;
};

// What this host throws when it raises an error.
struct Raised : std::exception {
    explicit Raised(std::string what) : text(std::move(what)) {}
    const char* what() const noexcept override { return text.c_str(); }
    std::string text;
};

struct Class final : tessel::HostClass {
    std::unique_ptr<tessel::HostClassInfo> info;
    std::vector<std::unique_ptr<tessel::HostMethodInfo>> methods;
    struct Property {
        std::string name, typeName;
        bool described = false;
        tessel::HostPropertyInfo info{};
    };
    std::vector<Property> properties;
    ~Class() {
        methods.clear();
        info.reset();
    }
};

class Host final : public tessel::HostInterface {
public:
    // Makes itself the host of the process.
    Host();
    ~Host() override;

    // What VXHostInterface answers; tests may lie.
    static tessel::HostGate& gate();

    // ---- Habits ----
    bool errorEntryReturns = false;     // HostError
    bool standardErrorsReturn = false;  // the other four
    long failingRequest = 0;            // the n-th request fails; 0: none

    // ---- Accounts ----
    long requests = 0;     // for arrays, signatures and conversions
    long arrays = 0;       // alive
    long signatures = 0;   // alive
    long nativeAsked = 0;  // calls of hostNativeObject
    long nativeGiven = 0;  // calls of hostSetNativeObject
    int registrations = 0;
    std::vector<std::string> errors;  // every error raised, in order

    // The one class that can be registered, or null.
    std::unique_ptr<Class> registered;
    tessel::HostMethodInfo& method(const std::string& name);

    // ---- Making arrays for tests ----
    Array text(const std::u16string& characters);
    Array cell(std::vector<Array> elements);
    Array texts(const std::vector<std::u16string>& rows);
    Array column(const std::vector<double>& values);
    Array byteColumn(const std::vector<std::uint8_t>& values);
    Array structure();

    // ---- HostInterface ----
    std::size_t hostNumel(const tessel::HostArray* array) override;
    std::string hostGetString(const tessel::HostArray* array) override;
    std::u16string hostGetUString(const tessel::HostArray* array) override;
    bool hostIsCell(const tessel::HostArray* array) override;
    const tessel::HostArray* hostCellElement(const tessel::HostArray* array,
                                             std::size_t index) override;
    void hostRealElements(const tessel::HostArray* array,
                          std::vector<double>& out) override;
    void hostRealElements(const tessel::HostArray* array,
                          std::vector<std::uint8_t>& out) override;
    const double* hostDoubleData(const tessel::HostArray* array,
                                 std::size_t count) override;
    bool hostIsStruct(const tessel::HostArray* array) override;
    bool hostHasField(const tessel::HostArray* array,
                      const char* field) override;
    const tessel::HostArray* hostFieldElement(const tessel::HostArray* array,
                                              const char* field,
                                              std::size_t index) override;
    tessel::HostArray* hostCreateCharArray(
        std::u16string_view characters) override;
    tessel::HostArray* hostCreateCell(std::size_t rows,
                                      std::size_t columns) override;
    void hostSetCell(tessel::HostArray* array, std::size_t index,
                     tessel::HostArray* element) override;
    tessel::HostArray* hostCreateNumeric(
        std::size_t rows, std::size_t columns,
        tessel::HostNumericClass numericClass) override;
    void* hostNumericData(tessel::HostArray* array) noexcept override;
    tessel::HostArray* hostCreateLogicalScalar(bool value) override;
    void hostReleaseArray(tessel::HostArray* array) noexcept override;
    void* hostNativeObject(const tessel::HostArray* instance,
                           const char* className) override;
    void hostSetNativeObject(tessel::HostArray* instance, const char* className,
                             void* native) override;
    tessel::HostArray* hostConvert(const tessel::HostSavedValue* saved,
                                   const char* typeName) override;
    void hostErrorTooManyOutputs() override;
    void hostErrorTooManyInputs() override;
    void hostErrorTooFewInputs() override;
    void hostErrorOutOfMemory() override;
    void HostError(
        std::string_view identifier,
        std::span<const tessel::HostMessageArgument> arguments) override;
    tessel::HostName hostInternName(const char* name) override;
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
                       std::unique_ptr<tessel::HostMethodInfo> info) override;
    void hostAddProperty(tessel::HostClass* definedClass,
                         const tessel::HostPropertyInfo& property) override;
    bool hostAlternativeMode() override { return true; }
    tessel::HostSignature* hostCreateSignature() override;
    void hostReleaseSignature(
        tessel::HostSignature* signature) noexcept override;
    void hostSignatureAddInput(tessel::HostSignature* signature,
                               const char* typeName, const char* name) override;
    void hostSignatureAddInstanceInput(tessel::HostSignature* signature,
                                       const char* className) override;
    void hostSignatureAddOutput(tessel::HostSignature* signature,
                                const char* typeName,
                                const char* name) override;
    void hostSignatureMarkOptionalTail(
        tessel::HostSignature* signature) override;
    void hostSignatureMarkOutputs(tessel::HostSignature* signature) override;

private:
    struct Package final : tessel::HostPackage {
        std::string fullName;
    };
    struct Name final : tessel::HostOpaque<tessel::HostNameTag> {
        std::string text;
    };

    // Whether the request that comes now is refused.
    bool refuses() { return ++requests == failingRequest; }
    void raise(const std::string& error, bool returns);
    Array box(std::size_t rows, std::size_t columns);

    std::map<std::string, Package> packages_;
    std::map<std::string, Name> names_;
};

}  // namespace unchecked
