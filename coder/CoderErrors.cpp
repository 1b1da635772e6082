#include "coder/CoderErrors.hpp"

namespace tessel {

const char* NoCodeForEmptyString::what() const noexcept {
    return "No code for an empty string.";
}

const char* CodeNotFoundException::what() const noexcept {
    return "Code for the character not found.";
}

}  // namespace tessel
