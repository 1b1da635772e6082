// The module qztessel._host: a host environment in which Python works with the
// plug-in's class. Its functions are no public interface; qztessel/_host.pyi
// has their types.
#include <pybind11/pybind11.h>
#include <pybind11/stl.h>
#include <pybind11/stl/filesystem.h>

#include <cstdint>
#include <exception>
#include <span>
#include <stdexcept>
#include <string>
#include <utility>
#include <variant>
#include <vector>

#include "hosts/embedded/FilesetClass.hpp"
#include "hosts/embedded/Host.hpp"
#include "hosts/python/host/Conversions.hpp"
#include "hosts/python/host/SharedHost.hpp"

namespace tessel::python {

namespace {

namespace py = pybind11;
using embedded::Host;
using embedded::Value;

// ---- Instances ----

// An instance of the class, as Python holds it. The plug-in's part of it ends
// in the host's turn, like any call.
class HeldInstance {
public:
    explicit HeldInstance(Value instance) : value_(std::move(instance)) {}
    HeldInstance(HeldInstance&&) noexcept = default;
    HeldInstance(const HeldInstance&) = delete;
    HeldInstance& operator=(const HeldInstance&) = delete;
    HeldInstance& operator=(HeldInstance&&) = delete;
    ~HeldInstance() {
        if (value_.valueClass() != embedded::ValueClass::Object) return;
        SharedHost::with([&](Host& /*host*/) { value_ = Value(); });
    }

    const Value& value() const noexcept { return value_; }

private:
    Value value_;
};

// The inputs of one call. An instance is an input of its own, never an element
// of another: the caller's tuple then holds it until the call has ended, and
// its last reference is not given back here, outside the host's turn.
class Inputs {
public:
    explicit Inputs(const py::tuple& objects) {
        values_.reserve(objects.size());
        for (const py::handle object : objects) values_.push_back(of(object));
        for (const Value& value : values_) pointers_.push_back(&value);
    }
    Inputs(const Inputs&) = delete;
    Inputs& operator=(const Inputs&) = delete;
    ~Inputs() = default;

    std::span<const Value* const> list() const noexcept { return pointers_; }

private:
    static Value of(py::handle object) {
        if (py::isinstance<HeldInstance>(object))
            return object.cast<const HeldInstance&>().value();
        return toValue(object);
    }

    std::vector<Value> values_;
    std::vector<const Value*> pointers_;
};

HeldInstance construct(const py::tuple& objects) {
    const Inputs inputs(objects);
    return HeldInstance(SharedHost::with([&](Host& host) {
        return host.constructWith(embedded::filesetClassName, inputs.list());
    }));
}

py::list call(const HeldInstance& instance, const std::string& method,
              std::int32_t requested, const py::tuple& objects) {
    const Inputs inputs(objects);
    const std::vector<Value> outputs = SharedHost::with([&](Host& host) {
        return host.callWith(requested, instance.value(), method,
                             inputs.list());
    });
    py::list list;
    for (const Value& output : outputs) list.append(toObject(output));
    return list;
}

py::object get(const HeldInstance& instance, const std::string& property) {
    return toObject(SharedHost::with(
        [&](Host& host) { return host.get(instance.value(), property); }));
}

// ---- Copying, saving, loading ----

HeldInstance copy(const HeldInstance& instance) {
    return HeldInstance(SharedHost::with(
        [&](Host& host) { return host.copy(instance.value()); }));
}

py::object save(const HeldInstance& instance) {
    return toObject(SharedHost::with(
        [&](Host& host) { return host.save(instance.value()); }));
}

// Whether custom load finds something to restore in a saved value.
bool hasContent(const Value& saved) {
    if (saved.valueClass() != embedded::ValueClass::Struct ||
        !saved.hasField("PathTree"))
        return false;
    return !saved.hasField("StringTree") ||
           saved.field("StringTree").numel() != 0;
}

HeldInstance load(py::handle object) {
    const Value saved = toValue(object);
    return HeldInstance(SharedHost::with([&](Host& host) {
        Value instance = host.load(embedded::filesetClassName, saved);
        if (hasContent(saved) && !host.isRestored(instance))
            throw std::invalid_argument(
                "this saved HuffmanPaths is damaged; take another copy of it");
        return instance;
    }));
}

// ---- Errors ----

// Bytes of a file's name that are not UTF-8 become lone surrogates.
py::object textOf(const std::string& text) {
    PyObject* const decoded = PyUnicode_DecodeUTF8(
        text.data(), static_cast<Py_ssize_t>(text.size()), "surrogateescape");
    if (decoded == nullptr) throw py::error_already_set();
    return py::reinterpret_steal<py::object>(decoded);
}

py::object argumentOf(const HostMessageArgument& argument) {
    if (const auto* const number = std::get_if<std::int64_t>(&argument))
        return py::int_(*number);
    return textOf(std::get<std::string>(argument));
}

void setHostError(const embedded::HostException& error) {
    py::list arguments;
    for (const HostMessageArgument& argument : error.arguments())
        arguments.append(argumentOf(argument));
    const py::tuple all = py::make_tuple(
        textOf(error.what()), textOf(error.identifier()), py::tuple(arguments));
    PyErr_SetObject(py::module_::import("qztessel").attr("HostError").ptr(),
                    all.ptr());
}

// NOLINTNEXTLINE(performance-unnecessary-value-param): as pybind11 wants it.
void translate(std::exception_ptr thrown) {
    try {
        if (thrown) std::rethrow_exception(thrown);
    } catch (const embedded::HostException& error) {
        setHostError(error);
    }
}

}  // namespace

PYBIND11_MODULE(_host, module) {
    py::register_local_exception_translator(&translate);
    module.def("installed_plugin", &SharedHost::installedPlugin);
    module.def("start", &SharedHost::start);
    module.def("construct", &construct);
    module.def("load", &load);
    py::class_<HeldInstance>(module, "Instance", py::module_local())
        .def("call", &call)
        .def("get", &get)
        .def("copy", &copy)
        .def("save", &save);
}

}  // namespace tessel::python
