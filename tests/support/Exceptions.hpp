#pragma once

#include <exception>
#include <stdexcept>
#include <type_traits>

namespace support {

// True of an exception class that derives from the standard base and from
// none of the standard's other classes, and adds no state.
template <class Failure>
constexpr bool derivesFromStandardBaseAlone() {
    return std::is_convertible_v<Failure*, std::exception*> &&
           !std::is_convertible_v<Failure*, std::runtime_error*> &&
           !std::is_convertible_v<Failure*, std::logic_error*> &&
           sizeof(Failure) == sizeof(std::exception);
}

}  // namespace support
