#include "hosts/python/Errors.hpp"

#include <exception>

#include "hosts/patterns/PatternException.hpp"
#include "paths/PathList.hpp"

namespace tessel::python {

namespace {

namespace py = pybind11;

// OSError chooses FileNotFoundError and its other kinds by errno.
void setSystemError(const FileException& error) {
    const auto file =
        py::reinterpret_steal<py::object>(PyUnicode_DecodeFSDefaultAndSize(
            error.file().data(), static_cast<Py_ssize_t>(error.file().size())));
    const py::tuple arguments =
        py::make_tuple(error.code().value(), error.code().message(), file);
    PyErr_SetObject(PyExc_OSError, arguments.ptr());
}

void setSystemError(const std::system_error& error) {
    const py::tuple arguments =
        py::make_tuple(error.code().value(), std::string(error.what()));
    PyErr_SetObject(PyExc_OSError, arguments.ptr());
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): as pybind11 wants it.
void translate(std::exception_ptr thrown) {
    try {
        if (thrown) std::rethrow_exception(thrown);
    } catch (const FileException& error) {
        setSystemError(error);
    } catch (const std::system_error& error) {
        setSystemError(error);
    } catch (const paths::PathListError& error) {
        PyErr_SetString(PyExc_ValueError, error.what());
    } catch (const patterns::PatternException& error) {
        PyErr_SetString(PyExc_ValueError, error.what());
    }
}

}  // namespace

void registerErrors(py::module_& module) {
    py::register_exception<DamagedListException>(module, "DamagedArchiveError",
                                                 PyExc_ValueError)
        .attr("__module__") = "qztessel";
    py::register_exception_translator(&translate);
}

}  // namespace tessel::python
