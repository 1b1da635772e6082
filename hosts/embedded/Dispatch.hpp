#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "hosts/embedded/Classes.hpp"
#include "hosts/embedded/Errors.hpp"
#include "hosts/embedded/Value.hpp"

namespace tessel::embedded {

// Who calls: a user of the host, or the host itself while it loads or copies.
enum class Caller { User, Host };

// Dispatch runs methods, getters and setters with the checks that their
// declarations ask for. Whatever they throw arrives as a HostException.
//
// Ownership: refers to the errors, which must outlive it.
class Dispatch {
public:
    explicit Dispatch(const Errors& errors) : errors_(errors) {}

    // Checks the counts (outputs, too many inputs, too few inputs), then the
    // declared types of the inputs, then runs the method.
    //
    // instance   the first input; null for a static method.
    // requested  how many outputs the caller wants; may be 0.
    // Returns the requested outputs. When none was requested, what the method
    // assigned to its first output, or nothing.
    std::vector<Value> call(const MethodRecord& method, const Value* instance,
                            std::span<const Value* const> inputs,
                            std::int32_t requested) const;

    // The same for the constructor of a new instance, which is its one output.
    void construct(const MethodRecord& method, Value& instance,
                   std::span<const Value* const> inputs,
                   std::int32_t requested) const;

    Value get(const Instance& instance, const PropertyRecord& property,
              Caller caller) const;
    void set(const Instance& instance, const PropertyRecord& property,
             const Value& value, Caller caller) const;

private:
    class Inputs;
    class OutputSlots;

    void checkCounts(const Signature& signature, std::size_t inputCount,
                     std::int32_t requested) const;
    void checkTypes(const Signature& signature, const Inputs& inputs) const;
    void run(const MethodRecord& method, OutputSlots& outputs,
             const Inputs& inputs, std::int32_t requested) const;
    void checkAccess(const PropertyRecord& property, HostAccess access,
                     Caller caller) const;
    void* nativeFor(const Instance& instance,
                    const PropertyRecord& property) const;

    const Errors& errors_;
};

}  // namespace tessel::embedded
