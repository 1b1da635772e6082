#pragma once

#include <stdexcept>
#include <string>

#include "hosts/console/ExitStatus.hpp"

namespace tessel::console {

// Ends the command. what() is one line for the user: what is wrong, in which
// file and line, and what to do; without the program's name and a full stop.
class ConsoleException : public std::runtime_error {
public:
    ConsoleException(ExitStatus status, const std::string& line)
        : std::runtime_error(line), status_(status) {}

    ExitStatus status() const noexcept { return status_; }

private:
    ExitStatus status_;
};

// Whoever reads the output has closed it. No fault: the command ends quietly.
class ClosedPipeException : public std::exception {
public:
    const char* what() const noexcept override {
        return "the reader of the output is gone";
    }
};

}  // namespace tessel::console
