#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

// The host interface: everything that the plug-in asks of the program that
// loads it, and everything that it offers to that program. A host implements
// HostInterface, exports VXHostInterface, and loads the plug-in; nothing in
// this file knows any one host.
//
// Errors: a host raises an error by throwing a C++ exception of its own
// choice, which passes through the plug-in and releases what the plug-in holds
// on the way. Unless a comment says otherwise, every operation may raise, and
// native exceptions of the plug-in, all derived from std::exception, leave
// through the host's call into it.
// Threads: the plug-in calls an operation only on the thread on which the host
// called it, never on a thread that it started itself.
// Pointers: never null, unless a comment says so.
// Runtime: host and plug-in share one C++ runtime, because standard types and
// exceptions cross between them.
namespace tessel {

class HostInterface;

// Changes with every change to this file that moves or alters a slot.
inline constexpr std::uint32_t hostInterfaceVersion = 1;

// What VXHostInterface answers. The layout of this struct is the same in every
// version, so that a plug-in can read `version` before it touches `host`.
struct HostGate {
    std::uint32_t version;
    HostInterface* host;  // null while the process runs no host
};

}  // namespace tessel

// The one symbol that a host process exports. A host that offers several
// versions answers with the gate of the wanted one; any other host answers with
// the gate it has. The gate belongs to the host and stays where it is as long
// as the plug-in is loaded. Never throws, never returns null.
extern "C" __attribute__((visibility("default"))) const tessel::HostGate*
VXHostInterface(std::uint32_t wantedVersion);

namespace tessel {

// The two functions that a module file libX.so exports are of this type:
// VXInitialize_libX, called by the host after loading and again on every entry
// in the alternative mode, and VXTerminate_libX, called before unloading.
using HostModuleEntry = void (*)();

// A value that only the host can look into. The host derives its own class from
// the instantiation and casts down; nothing is ever released through it.
template <class Tag>
class HostOpaque {
protected:
    HostOpaque() = default;
    HostOpaque(const HostOpaque&) = default;
    HostOpaque(HostOpaque&&) noexcept = default;
    HostOpaque& operator=(const HostOpaque&) = default;
    HostOpaque& operator=(HostOpaque&&) noexcept = default;
    ~HostOpaque() = default;
};

// A value of the host's array type: numeric, char, logical, cell, struct or
// object instance, its elements in column-major order. An input is borrowed for
// the duration of the call. A created array belongs to the plug-in until it is
// put into a cell, handed out or given to hostReleaseArray.
using HostArray = HostOpaque<struct HostArrayTag>;
// A value as the host's saved form keeps it, before conversion to an array.
using HostSavedValue = HostOpaque<struct HostSavedValueTag>;
// The signature of one method.
using HostSignature = HostOpaque<struct HostSignatureTag>;
// A package and a class, both owned by the host.
using HostPackage = HostOpaque<struct HostPackageTag>;
using HostClass = HostOpaque<struct HostClassTag>;
// An interned name: equal texts give equal pointers, as long as the host lives.
// The null name, a null pointer, is that of the empty text.
using HostName = const HostOpaque<struct HostNameTag>*;

// A message argument of an error.
using HostMessageArgument = std::variant<std::int64_t, std::string>;

enum class HostNumericClass : std::uint32_t { Double = 0, Uint8 = 1 };

// Who may use an operation of a property or call a method.
enum class HostAccess : std::uint32_t {
    Public = 0,     // everybody
    Restricted = 2  // the class itself, loading and copying
};

// Bits of a property's attribute word.
namespace attributes {
inline constexpr std::uint32_t isAbstract = 1U << 0U;
inline constexpr std::uint32_t initialisationAllowed = 1U << 1U;
inline constexpr std::uint32_t defaultAllowed = 1U << 2U;
inline constexpr std::uint32_t resetAllowed = 1U << 3U;
inline constexpr std::uint32_t isSealed = 1U << 4U;
inline constexpr std::uint32_t isTransient = 1U << 5U;
inline constexpr std::uint32_t copiedWithInstance = 1U << 6U;
inline constexpr std::uint32_t getListenersAllowed = 1U << 7U;
inline constexpr std::uint32_t setListenersAllowed = 1U << 8U;
inline constexpr std::uint32_t inspectionAllowed = 1U << 9U;
inline constexpr std::uint32_t abortSetWhenUnchanged = 1U << 10U;
inline constexpr std::uint32_t isVisible = 1U << 11U;
inline constexpr std::uint32_t isStatic = 1U << 12U;
inline constexpr std::uint32_t isDependent = 1U << 13U;
inline constexpr std::uint32_t warnOnCopyError = 1U << 15U;
}  // namespace attributes

// The frame of one method call.
//
// outputCount  the number of outputs requested. The method may raise it to say
//              that it filled a slot nobody asked for.
// outputs      one slot for each declared output, at least one and at least
//              outputCount. All are null, but in a constructor the first
//              holds the new instance, which stays the host's. Whatever else
//              is in the slots after the call is the host's, whether the
//              method returned or threw. (The methods of HuffmanPaths fill
//              their slots last: one that throws has filled none.)
// inputs       inputCount borrowed arrays; the instance first, but not in a
//              constructor.
struct HostFrame {
    std::int32_t outputCount;
    HostArray** outputs;
    std::int32_t inputCount;
    const HostArray* const* inputs;
};

// HostMethodInfo describes one method of a class and runs it.
//
// Ownership: the host owns it from hostAddMethod on and deletes it together
//   with its class, while the module that made it is still loaded.
// Threads: execute runs on the host's calling thread.
class HostMethodInfo {
public:
    HostMethodInfo() = default;
    HostMethodInfo(const HostMethodInfo&) = delete;
    HostMethodInfo& operator=(const HostMethodInfo&) = delete;
    virtual ~HostMethodInfo() = default;

    // Stays valid as long as the descriptor. A method of its class's name is
    // the constructor. Never throws.
    virtual const char* name() const noexcept = 0;

    // The descriptor's own signature; borrowed. Never throws.
    virtual const HostSignature* signature() const noexcept = 0;

    // Runs the method. Host errors and native exceptions leave it as they are.
    virtual void execute(HostFrame& frame) = 0;

    virtual const char* description() const noexcept { return ""; }
    virtual HostAccess access() const noexcept { return HostAccess::Public; }
    virtual bool isStatic() const noexcept { return false; }
    virtual bool isAbstract() const noexcept { return false; }
    virtual bool isSealed() const noexcept { return false; }
    virtual bool isVisible() const noexcept { return true; }
};

// HostClassInfo describes one class: its name, its members, and what becomes of
// the native object of each instance.
//
// Ownership: the host owns it from hostRegisterClass on and deletes it while
//   the module that made it is still loaded, when no instance is left.
// Threads: every operation runs on the host's calling thread.
class HostClassInfo {
public:
    HostClassInfo() = default;
    HostClassInfo(const HostClassInfo&) = delete;
    HostClassInfo& operator=(const HostClassInfo&) = delete;
    virtual ~HostClassInfo() = default;

    // Without the package. Stays valid as long as the descriptor.
    virtual const char* className() const noexcept = 0;

    // Adds methods and properties to the class being defined. Called once,
    // inside hostRegisterClass. If it throws, the host forgets the class and
    // deletes the descriptor and the members added so far.
    virtual void defineMembers(HostClass* definedClass) = 0;

    // Makes the native object of a new instance. The host keeps the pointer
    // and gives it back to destroyNativeObject exactly once.
    virtual void* createNativeObject() = 0;

    // native  may be null.
    virtual void destroyNativeObject(void* native) noexcept = 0;

    // Called last, after a load or a copy has set an instance's properties.
    virtual void updateInstance(void* /*native*/) {}

    // Whether the host may copy an instance: make a new one and carry over the
    // properties marked as copied with the instance.
    virtual bool copiesInstances() const noexcept { return false; }

    // Whether the host leaves the class out of its lists.
    virtual bool isHidden() const noexcept { return false; }

    // Whether the host may save an instance and load it again.
    virtual bool savesInstances() const noexcept { return false; }

    // The whole saved form of an instance, handed to the host, or null to let
    // the host save the properties in its own way.
    virtual HostArray* customSave(const HostArray* /*instance*/) {
        return nullptr;
    }

    // Restores the native object of a new instance, whose constructor does not
    // run, from a saved value. The host sets the saved properties afterwards,
    // then calls updateInstance. Both arguments are borrowed. The one of
    // HuffmanPaths never throws: see hostSetNativeObject.
    virtual void customLoad(HostArray* /*instance*/,
                            const HostSavedValue* /*saved*/) {}
};

// Getters and setters receive the instance's native object, or null for a
// static property. A setter borrows its value. A getter's result is the host's:
// it may use, change and keep the array, and gives it to the disposer in the
// end, exactly once and while the module is loaded. Null: no memory.
using HostPropertyGetter = HostArray* (*)(void* native);
using HostPropertySetter = void (*)(void* native, const HostArray* value);
using HostValueDisposer = void (*)(HostArray* value);  // value may be null

// What add-property is given; the host copies it. The texts are borrowed.
struct HostPropertyInfo {
    const char* name;
    const char* description;  // null: none
    const char* typeName;
    std::uint32_t attributeBits;
    HostAccess getAccess;
    HostAccess setAccess;
    HostPropertyGetter getter;
    HostPropertySetter setter;
    HostValueDisposer disposer;
};

// HostInterface is what a host implements.
//
// Creating operations (hostCreate..., hostConvert) either raise the host's
// out-of-memory error themselves or answer null; for null the plug-in releases
// what it holds and then calls hostErrorOutOfMemory.
class HostInterface {
public:
    HostInterface() = default;
    HostInterface(const HostInterface&) = delete;
    HostInterface& operator=(const HostInterface&) = delete;
    virtual ~HostInterface() = default;

    // ---- Reading arrays ----

    // The product of the dimensions; 1 for an array without dimensions.
    virtual std::size_t hostNumel(const HostArray* array) = 0;

    // The text of a char array in column-major order, narrow or UTF-16. The
    // plug-in asks for it without looking at the class first: a host should
    // raise an error for any other array.
    virtual std::string hostGetString(const HostArray* text) = 0;
    virtual std::u16string hostGetUString(const HostArray* text) = 0;

    virtual bool hostIsCell(const HostArray* array) = 0;

    // The element at a 0-based linear index; borrowed, valid while the cell is
    // neither changed nor released. An element never set is an empty array,
    // not null. The plug-in asks without looking at the class first: a host
    // should raise an error for an array that is no cell.
    virtual const HostArray* hostCellElement(const HostArray* cell,
                                             std::size_t index) = 0;

    // Replaces `out` by the real parts of all elements, one for each, read as
    // the element type of `out`; of complex data, stored interleaved, every
    // second value. The
    // plug-in asks without looking at the class first: a host should raise an
    // error rather than read an array of another class.
    virtual void hostRealElements(const HostArray* numeric,
                                  std::vector<double>& out) = 0;
    virtual void hostRealElements(const HostArray* numeric,
                                  std::vector<std::uint8_t>& out) = 0;

    // The data of a double array, of which the plug-in will read the first
    // `count` doubles as they are in memory; borrowed. The plug-in checks
    // neither class nor length: a host should raise an error unless there are
    // that many elements, and for complex data, whose imaginary parts would be
    // read, too.
    virtual const double* hostDoubleData(const HostArray* numeric,
                                         std::size_t count) = 0;

    virtual bool hostIsStruct(const HostArray* array) = 0;
    virtual bool hostHasField(const HostArray* structure,
                              const char* field) = 0;

    // The field of the element at a 0-based index; borrowed. Raises an error
    // when there is no such element or field.
    virtual const HostArray* hostFieldElement(const HostArray* structure,
                                              const char* field,
                                              std::size_t index) = 0;

    // ---- Creating, filling and releasing arrays ----

    // A 1 x n char row.
    virtual HostArray* hostCreateCharArray(std::u16string_view text) = 0;

    // A cell whose elements are empty arrays.
    virtual HostArray* hostCreateCell(std::size_t rows,
                                      std::size_t columns) = 0;

    // Stores an element at a 0-based linear index. The cell takes it over,
    // also when the operation raises an error.
    virtual void hostSetCell(HostArray* cell, std::size_t index,
                             HostArray* element) = 0;

    // A real array; its values are unspecified until they are written through
    // hostNumericData.
    virtual HostArray* hostCreateNumeric(std::size_t rows, std::size_t columns,
                                         HostNumericClass numericClass) = 0;

    // The data of an array from hostCreateNumeric. Never raises.
    virtual void* hostNumericData(HostArray* numeric) noexcept = 0;

    virtual HostArray* hostCreateLogicalScalar(bool value) = 0;

    // Releases a created or converted array that was not handed out, with all
    // it holds. Never raises.
    virtual void hostReleaseArray(HostArray* array) noexcept = 0;

    // ---- Instances ----

    // The native object that the host keeps for element 1 of an instance array
    // of the named class (its full name); borrowed. The plug-in asks without
    // looking at the class first: a host must raise an error for anything but
    // a living instance of that class.
    virtual void* hostNativeObject(const HostArray* instance,
                                   const char* className) = 0;

    // Gives back the native object that hostNativeObject answered: once for
    // each custom load that restored something, and never for one that failed,
    // so that a host can tell them apart.
    virtual void hostSetNativeObject(HostArray* instance, const char* className,
                                     void* native) = 0;

    // Converts a saved value to an array of the named type ("any" accepts
    // every value). The array belongs to the plug-in.
    virtual HostArray* hostConvert(const HostSavedValue* saved,
                                   const char* typeName) = 0;

    // ---- Errors ----

    // The host's standard errors. They do not return; should one return all
    // the same, the plug-in throws a native exception in its place.
    virtual void hostErrorTooManyOutputs() = 0;
    virtual void hostErrorTooManyInputs() = 0;
    virtual void hostErrorTooFewInputs() = 0;
    virtual void hostErrorOutOfMemory() = 0;

    // Raises the error of a message identifier; the host looks its text up in
    // its message catalogue and fills the arguments in. Does not return;
    // should it return all the same, the plug-in throws the error as a native
    // exception.
    virtual void HostError(std::string_view identifier,
                           std::span<const HostMessageArgument> arguments) = 0;

    // ---- Names, packages, classes ----

    // The interned name of a text; the null name for an empty one.
    virtual HostName hostInternName(const char* text) = 0;

    // A package at the top level, and one inside another; null if there is
    // none of that name.
    virtual HostPackage* hostGlobalPackage(const char* name) = 0;
    virtual HostPackage* hostSubPackage(HostPackage* package,
                                        const char* name) = 0;

    // The dotted name of a package, valid as long as the package, or null.
    virtual const char* hostPackageFullName(const HostPackage* package) = 0;

    // The registered class of a full name, or null.
    virtual HostClass* hostFindClass(HostName fullName) = 0;

    // Defines a class in a package (calling defineMembers) and registers it.
    // The host owns the descriptor, also when the operation raises an error.
    virtual void hostRegisterClass(HostPackage* package,
                                   std::unique_ptr<HostClassInfo> info) = 0;

    // Both only for the class being defined, inside defineMembers. The host
    // owns the method, also when the operation raises an error.
    virtual void hostAddMethod(HostClass* definedClass,
                               std::unique_ptr<HostMethodInfo> method) = 0;
    virtual void hostAddProperty(HostClass* definedClass,
                                 const HostPropertyInfo& property) = 0;

    // Whether modules register their classes on every entry call. Otherwise
    // they do it once as long as they are loaded.
    virtual bool hostAlternativeMode() = 0;

    // ---- Signatures ----

    // A new signature without inputs and outputs. It belongs to the plug-in,
    // whose method descriptor releases it when the host deletes it.
    virtual HostSignature* hostCreateSignature() = 0;
    virtual void hostReleaseSignature(HostSignature* signature) noexcept = 0;

    // Each appends an input or output. A type is "any", the name of a class of
    // values ("char", "cell", "double") or the full name of a class.
    virtual void hostSignatureAddInput(HostSignature* signature,
                                       const char* typeName,
                                       const char* name) = 0;
    virtual void hostSignatureAddInstanceInput(HostSignature* signature,
                                               const char* className) = 0;
    virtual void hostSignatureAddOutput(HostSignature* signature,
                                        const char* typeName,
                                        const char* name) = 0;

    // Declared inputs may be left out from the end; the method itself checks
    // how many there are.
    virtual void hostSignatureMarkOptionalTail(HostSignature* signature) = 0;

    // Fewer outputs than declared may be requested.
    virtual void hostSignatureMarkOutputs(HostSignature* signature) = 0;
};

}  // namespace tessel
