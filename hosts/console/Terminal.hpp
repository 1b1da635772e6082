#pragma once

#include <cstddef>

// What the command wants to know about the terminal, if there is one.
namespace tessel::console {

bool isTerminal(int descriptor) noexcept;

// Whether colours may be written to the descriptor: it is a terminal that is
// not dumb, and the variable NO_COLOR is unset or empty.
bool showsColours(int descriptor) noexcept;

// Columns of the terminal; 80 if it does not say.
std::size_t columnsOf(int descriptor) noexcept;

}  // namespace tessel::console
