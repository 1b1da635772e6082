#pragma once

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "hosts/python/View.hpp"

namespace tessel::python {

// Views and indices as Python has them. The calling thread holds the
// interpreter's lock.

using IndexArray = pybind11::array_t<std::int64_t, pybind11::array::c_style>;

template <class Number>
IndexArray arrayOf(const std::vector<Number>& numbers) {
    IndexArray array(static_cast<pybind11::ssize_t>(numbers.size()));
    std::ranges::copy(numbers, array.mutable_data());
    return array;
}

// Indices of a list of `size` paths that may count from the end, from the
// start. Throw IndexError.
std::uint64_t fromStart(std::uint64_t size, const pybind11::object& index);
std::vector<std::uint64_t> fromStart(std::uint64_t size,
                                     const IndexArray& given);

// Throws IndexError if not all of the slice is within the view.
View sliced(const View& view, std::uint64_t first, std::int64_t step,
            std::uint64_t count);
// Throws IndexError.
View selected(const View& view, const IndexArray& indices);

// For each step, a tuple of the name of the method that makes it and the
// method's arguments.
pybind11::list stepsOf(const View& view);

// Binds what makes and shows views to a class whose objects have one.
//
// viewOf  the view of an object
// with    the same object with another view
template <class Class, class ViewOf, class With>
void bindViews(pybind11::class_<Class>& type, ViewOf viewOf, With with) {
    type.def("slice",
             [=](const Class& object, std::uint64_t first, std::int64_t step,
                 std::uint64_t count) {
                 return with(object,
                             sliced(viewOf(object), first, step, count));
             })
        .def("shuffled",
             [=](const Class& object, std::uint64_t seed) {
                 return with(object, viewOf(object).shuffled(seed));
             })
        .def("select",
             [=](const Class& object, const IndexArray& indices) {
                 return with(object, selected(viewOf(object), indices));
             })
        .def("steps",
             [=](const Class& object) { return stepsOf(viewOf(object)); })
        .def_property_readonly(
            "is_whole",
            [=](const Class& object) { return viewOf(object).isWhole(); })
        .def_property_readonly("heap_bytes", [=](const Class& object) {
            return viewOf(object).heapBytes();
        });
}

// The class View itself, for lists whose paths are not in one archive.
void bindView(pybind11::module_& module);

}  // namespace tessel::python
