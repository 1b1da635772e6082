#pragma once

#include <exception>

namespace tessel {

// Iteration was asked for a path and has none left.
class NoMorePathException : public std::exception {
public:
    const char* what() const noexcept override;
};

// A track was to be followed in a tree without paths.
class NoTreeToTraverseException : public std::exception {
public:
    const char* what() const noexcept override;
};

// An empty track was to be followed.
class EmptyPathForTraverseException : public std::exception {
public:
    const char* what() const noexcept override;
};

// A node code of the stored form is none of the four.
class UnknownNodeTypeException : public std::exception {
public:
    const char* what() const noexcept override;
};

}  // namespace tessel
