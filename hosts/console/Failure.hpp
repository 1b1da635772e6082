#pragma once

#include <string>

#include "hosts/console/ExitStatus.hpp"

namespace tessel::console {

// What the user is told when memory runs out.
inline constexpr const char* outOfMemoryLine =
    "memory is used up; close other programs or raise the limit";

// How the command ends after an exception.
struct Failure {
    ExitStatus status = ExitStatus::System;
    std::string line;  // what the user is told
};

// Describes the exception that is being handled; call it in a catch block.
// Exceptions that concern an archive should have passed inFile before.
Failure describeCurrentException();

// Throws what is being handled again. Exceptions of an archive's reader or
// writer become a ConsoleException that names the file and says what to do;
// all others stay.
[[noreturn]] void rethrowNaming(const std::string& file);

// Calls work() and names the file in what it throws.
template <class Work>
auto inFile(const std::string& file, Work work) {
    try {
        return work();
    } catch (...) {
        rethrowNaming(file);
    }
}

}  // namespace tessel::console
