#include "hosts/python/host/Conversions.hpp"

#include <pybind11/numpy.h>

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace tessel::python {

namespace {

namespace py = pybind11;
using embedded::Value;
using embedded::ValueClass;

py::object steal(PyObject* object) {
    if (object == nullptr) throw py::error_already_set();
    return py::reinterpret_steal<py::object>(object);
}

// Values nest as deep as Python's recursion limit lets them.
class RecursionGuard {
public:
    RecursionGuard() {
        if (Py_EnterRecursiveCall(" while a value is converted") != 0)
            throw py::error_already_set();
    }
    RecursionGuard(const RecursionGuard&) = delete;
    RecursionGuard& operator=(const RecursionGuard&) = delete;
    ~RecursionGuard() { Py_LeaveRecursiveCall(); }
};

// To be called for each element: 4,096 elements take about half a millisecond.
void handleSignals(std::size_t index) {
    if (index % 4096 == 0 && PyErr_CheckSignals() != 0)
        throw py::error_already_set();
}

bool isSurrogate(char16_t unit) noexcept { return (unit & 0xF800U) == 0xD800U; }

// Values nest, and so do the functions that walk them.
// NOLINTBEGIN(misc-no-recursion)

// ---- To the host ----

// Characters beyond the first 65,536 become pairs of surrogates.
std::u16string toUtf16(const Py_UCS4* characters, std::size_t count) {
    std::u16string units;
    units.reserve(count + 1);
    for (std::size_t i = 0; i < count; ++i) {
        const Py_UCS4 code = characters[i];
        if (code < 0x10000U) {
            units += static_cast<char16_t>(code);
        } else {
            units += static_cast<char16_t>(0xD7C0U + (code >> 10U));
            units += static_cast<char16_t>(0xDC00U + (code & 0x3FFU));
        }
    }
    return units;
}

Value fromText(py::handle text) {
    const auto count =
        static_cast<std::size_t>(PyUnicode_GET_LENGTH(text.ptr()));
    const void* const data = PyUnicode_DATA(text.ptr());
    const auto kind = PyUnicode_KIND(text.ptr());
    if (kind == PyUnicode_1BYTE_KIND) {
        const auto* const characters = static_cast<const Py_UCS1*>(data);
        return Value::text(std::u16string(characters, characters + count));
    }
    if (kind == PyUnicode_2BYTE_KIND)
        return Value::text({static_cast<const char16_t*>(data), count});
    return Value::text(toUtf16(static_cast<const Py_UCS4*>(data), count));
}

Value fromNumber(py::handle number) {
    const double value = PyFloat_AsDouble(number.ptr());
    if (value == -1.0 && PyErr_Occurred() != nullptr)
        throw py::error_already_set();
    return Value::scalar(value);
}

Value fromBytes(const char* data, Py_ssize_t size) {
    return Value::byteColumn(std::vector<std::uint8_t>(data, data + size));
}

// A tuple cannot change while a signal handler runs.
Value fromTuple(const py::tuple& elements) {
    Value cell = Value::cell(elements.size(), 1);
    std::size_t index = 0;
    for (const py::handle element : elements) {
        handleSignals(index);
        cell.setElement(index++, toValue(element));
    }
    return cell;
}

Value fromDict(const py::dict& fields) {
    Value structure = Value::structure();
    for (const py::handle item : py::list(fields.attr("items")())) {
        const auto [key, value] =
            item.cast<std::pair<py::object, py::object>>();
        if (!py::isinstance<py::str>(key))
            throw py::type_error("the keys of a dict must be str");
        structure.setField(key.cast<std::string>(), toValue(value));
    }
    return structure;
}

// The elements of an array in column-major order.
template <class Element>
std::vector<Element> elementsOf(const py::array& array) {
    using Columns =
        py::array_t<Element, py::array::f_style | py::array::forcecast>;
    const Columns columns(array);
    return {columns.data(), columns.data() + columns.size()};
}

Value fromArray(const py::array& array) {
    const char kind = array.dtype().kind();
    if (kind == 'O' || kind == 'U')
        return fromTuple(
            py::tuple(array.attr("flatten")("F").attr("tolist")()));
    if (kind == 'u' && array.itemsize() == 1)
        return Value::byteColumn(elementsOf<std::uint8_t>(array));
    if (kind == 'b') {
        const auto count = static_cast<std::size_t>(array.size());
        return Value::logicals({count, 1}, elementsOf<std::uint8_t>(array));
    }
    if (kind == 'i' || kind == 'u' || kind == 'f')
        return Value::column(elementsOf<double>(array));
    throw py::type_error("an array of " +
                         py::str(array.dtype()).cast<std::string>() +
                         " has no form in the host; give one of float64, "
                         "uint8, bool or object");
}

bool isArrayLike(py::handle object) {
    return PyMemoryView_Check(object.ptr()) ||
           py::isinstance(object, py::module_::import("numpy").attr("generic"));
}

// ---- To Python ----

py::object textOf(std::u16string_view text) {
    if (std::ranges::none_of(text, isSurrogate))
        return steal(
            PyUnicode_FromKindAndData(PyUnicode_2BYTE_KIND, text.data(),
                                      static_cast<Py_ssize_t>(text.size())));
    int byteOrder = std::endian::native == std::endian::little ? -1 : 1;
    return steal(PyUnicode_DecodeUTF16(
        reinterpret_cast<const char*>(text.data()),
        static_cast<Py_ssize_t>(text.size() * sizeof(char16_t)),
        "surrogatepass", &byteOrder));
}

template <class Element>
py::object arrayOf(const std::vector<Element>& elements) {
    return py::array_t<Element>(static_cast<Py_ssize_t>(elements.size()),
                                elements.data());
}

py::object listOf(const Value& cell) {
    py::list list(cell.numel());
    for (std::size_t i = 0; i < cell.numel(); ++i) {
        handleSignals(i);
        PyList_SET_ITEM(list.ptr(), static_cast<Py_ssize_t>(i),
                        toObject(cell.element(i)).release().ptr());
    }
    return list;
}

py::object dictOf(const Value& structure) {
    py::dict dict;
    for (const std::string& name : structure.fieldNames())
        dict[py::str(name)] = toObject(structure.field(name));
    return dict;
}

}  // namespace

embedded::Value toValue(py::handle object) {
    const RecursionGuard guard;
    PyObject* const pointer = object.ptr();
    if (PyUnicode_Check(pointer)) return fromText(object);
    if (object.is_none()) return {};
    if (PyBool_Check(pointer)) return Value::logical(pointer == Py_True);
    if (PyFloat_Check(pointer) || PyLong_Check(pointer))
        return fromNumber(object);
    if (PyBytes_Check(pointer))
        return fromBytes(PyBytes_AS_STRING(pointer), PyBytes_GET_SIZE(pointer));
    if (PyByteArray_Check(pointer))
        return fromBytes(PyByteArray_AS_STRING(pointer),
                         PyByteArray_GET_SIZE(pointer));
    if (PyList_Check(pointer) || PyTuple_Check(pointer))
        return fromTuple(py::tuple(py::reinterpret_borrow<py::object>(object)));
    if (PyDict_Check(pointer))
        return fromDict(py::reinterpret_borrow<py::dict>(object));
    if (py::isinstance<py::array>(object))
        return fromArray(py::reinterpret_borrow<py::array>(object));
    if (isArrayLike(object))
        return fromArray(py::array(py::reinterpret_borrow<py::object>(object)));
    throw py::type_error(
        std::string("a value of type ") + Py_TYPE(pointer)->tp_name +
        " has no form in the host; give str, numbers, bytes, arrays, or lists "
        "of these");
}

py::object toObject(const embedded::Value& value) {
    switch (value.valueClass()) {
        case ValueClass::Char:
            return textOf(value.charData());
        case ValueClass::Logical:
            return py::bool_(value.truth(0));
        case ValueClass::Uint8:
            return arrayOf(value.byteData());
        case ValueClass::Cell:
            return listOf(value);
        case ValueClass::Struct:
            return dictOf(value);
        case ValueClass::Double:
            if (value.dimensions() == embedded::Dimensions{0, 0})
                return py::none();
            return arrayOf(value.doubleData());
        default:
            throw std::logic_error("An instance has no Python value.");
    }
}

// NOLINTEND(misc-no-recursion)

}  // namespace tessel::python
