#pragma once

#include "hosts/console/Interrupts.hpp"
#include "hosts/console/OutputBuffer.hpp"

namespace tessel::console {

// What every command works with.
struct Session {
    Interrupts& interrupts;
    OutputBuffer& output;  // standard output
    OutputBuffer& errors;  // standard error
};

}  // namespace tessel::console
