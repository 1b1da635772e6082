#pragma once

#include <exception>

namespace tessel {

// An empty text was to be encoded.
class NoCodeForEmptyString : public std::exception {
public:
    const char* what() const noexcept override;
};

// A text to be encoded holds a character that has no code.
class CodeNotFoundException : public std::exception {
public:
    const char* what() const noexcept override;
};

}  // namespace tessel
