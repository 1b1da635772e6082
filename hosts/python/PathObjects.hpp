#pragma once

#include <pybind11/pybind11.h>

#include <cstdint>
#include <string>
#include <string_view>

#include "paths/PathList.hpp"

namespace tessel::python {

// What a list's paths are in Python.
enum class PathKind : std::uint8_t {
    Text,  // str; bytes that are not UTF-8 as lone surrogates (PEP 383)
    Bytes
};

// A new object for a path. Throws pybind11::error_already_set.
pybind11::object toObject(std::string_view path, PathKind kind);

// Appends the objects of all paths to a list.
void appendObjects(const paths::PathList& texts, PathKind kind,
                   pybind11::list& list);

// PathBytes are the bytes of a path given as str, bytes or os.PathLike. The
// interpreter's lock must be held while it lives.
class PathBytes {
public:
    // Throws pybind11::error_already_set: TypeError for other objects,
    // UnicodeEncodeError for surrogates that are no escaped bytes.
    explicit PathBytes(pybind11::object path);

    // Valid as long as this object.
    std::string_view view() const noexcept { return view_; }

private:
    void takeText();
    void takeBytes() noexcept;

    pybind11::object owner_;
    std::string_view view_;
};

}  // namespace tessel::python
