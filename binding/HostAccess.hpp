#pragma once

#include <cstdint>
#include <exception>
#include <memory>
#include <string>
#include <utility>

#include "binding/HostInterface.hpp"

namespace tessel::binding {

// The host cannot be used: it offers another version of the host interface, or
// the process runs none. what() says which.
class HostRefusedException : public std::exception {
public:
    explicit HostRefusedException(std::string text) : text_(std::move(text)) {}
    const char* what() const noexcept override { return text_.c_str(); }

private:
    std::string text_;
};

// An error operation of the host returned, which it must not.
class HostReturnedException : public std::exception {
public:
    const char* what() const noexcept override {
        return "The host returned from raising an error.";
    }
};

// A host array could not be allocated. Travels from the place of the failure
// to reportingAllocationFailure and no further.
class HostAllocationFailure : public std::exception {
public:
    const char* what() const noexcept override {
        return "The host could not allocate an array.";
    }
};

// The host of this process. Asks for its version first, every time, so that
// nothing is ever called through the table of another version.
//
// Throws HostRefusedException.
HostInterface& host();

// Releases an array that was not handed out.
struct ArrayReleaser {
    void operator()(HostArray* array) const noexcept;
};
using OwnedArray = std::unique_ptr<HostArray, ArrayReleaser>;

// Each makes a new array. Throws HostAllocationFailure when the host has no
// room for it and answers null.
OwnedArray createText(std::u16string_view text);
OwnedArray createCell(std::size_t rows, std::size_t columns);
OwnedArray createNumeric(std::size_t rows, HostNumericClass numericClass);
OwnedArray createLogical(bool value);

// Raises the host's out-of-memory error.
[[noreturn]] void raiseOutOfMemory();

// Runs an action. A HostAllocationFailure that leaves it becomes the host's
// out-of-memory error, once everything the action held has been released.
template <class Action>
auto reportingAllocationFailure(Action action) {
    try {
        return action();
    } catch (const HostAllocationFailure&) {  // raised below, outside of it
    }
    raiseOutOfMemory();
}

}  // namespace tessel::binding
