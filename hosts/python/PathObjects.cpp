#include "hosts/python/PathObjects.hpp"

#include <utility>

namespace tessel::python {

namespace py = pybind11;

namespace {

py::object steal(PyObject* object) {
    if (object == nullptr) throw py::error_already_set();
    return py::reinterpret_steal<py::object>(object);
}

}  // namespace

// ---- To Python ----

py::object toObject(std::string_view path, PathKind kind) {
    const auto size = static_cast<Py_ssize_t>(path.size());
    if (kind == PathKind::Bytes)
        return steal(PyBytes_FromStringAndSize(path.data(), size));
    return steal(PyUnicode_DecodeUTF8(path.data(), size, "surrogateescape"));
}

void appendObjects(const paths::PathList& texts, PathKind kind,
                   py::list& list) {
    for (std::size_t i = 0; i < texts.size(); ++i)
        if (PyList_Append(list.ptr(), toObject(texts[i], kind).ptr()) != 0)
            throw py::error_already_set();
}

// ---- From Python ----

PathBytes::PathBytes(py::object path) : owner_(std::move(path)) {
    if (PyBytes_Check(owner_.ptr()) == 0 && PyUnicode_Check(owner_.ptr()) == 0)
        owner_ = steal(PyOS_FSPath(owner_.ptr()));
    if (PyUnicode_Check(owner_.ptr()) != 0)
        takeText();
    else
        takeBytes();
}

void PathBytes::takeText() {
    if (PyUnicode_IS_COMPACT_ASCII(owner_.ptr()) != 0) {
        view_ = {static_cast<const char*>(PyUnicode_DATA(owner_.ptr())),
                 static_cast<std::size_t>(PyUnicode_GET_LENGTH(owner_.ptr()))};
        return;
    }
    owner_ = steal(
        PyUnicode_AsEncodedString(owner_.ptr(), "utf-8", "surrogateescape"));
    takeBytes();
}

void PathBytes::takeBytes() noexcept {
    view_ = {PyBytes_AS_STRING(owner_.ptr()),
             static_cast<std::size_t>(PyBytes_GET_SIZE(owner_.ptr()))};
}

}  // namespace tessel::python
