#include "hosts/python/ViewObjects.hpp"

#include <pybind11/stl.h>

#include <memory>
#include <span>
#include <variant>

#include "hosts/python/InterpreterLock.hpp"

namespace tessel::python {

namespace py = pybind11;

// ---- Indices ----

namespace {

std::uint64_t countedFromStart(std::uint64_t size, std::int64_t index) {
    const auto count = static_cast<std::int64_t>(size);
    if (index < -count || index >= count)
        throw py::index_error("list index " + std::to_string(index) +
                              " is out of range for " + std::to_string(size) +
                              " paths");
    return static_cast<std::uint64_t>(index < 0 ? index + count : index);
}

}  // namespace

std::uint64_t fromStart(std::uint64_t size, const py::object& index) {
    const std::int64_t number =
        PyNumber_AsSsize_t(index.ptr(), PyExc_IndexError);
    if (number == -1 && PyErr_Occurred() != nullptr)
        throw py::error_already_set();
    return countedFromStart(size, number);
}

std::vector<std::uint64_t> fromStart(std::uint64_t size,
                                     const IndexArray& given) {
    std::vector<std::uint64_t> indices;
    indices.reserve(static_cast<std::size_t>(given.size()));
    for (const std::int64_t index :
         std::span(given.data(), static_cast<std::size_t>(given.size())))
        indices.push_back(countedFromStart(size, index));
    return indices;
}

// ---- Views ----

View sliced(const View& view, std::uint64_t first, std::int64_t step,
            std::uint64_t count) {
    const std::uint64_t size = view.size();
    const std::uint64_t last =
        first + (count - 1) * static_cast<std::uint64_t>(step);
    if (count > 0 && (first >= size || last >= size || count > size))
        throw py::index_error("the slice is not within the list");
    return view.sliced(first, step, count);
}

View selected(const View& view, const IndexArray& indices) {
    return view.selected(std::make_shared<const std::vector<std::uint64_t>>(
        fromStart(view.size(), indices)));
}

namespace {

py::tuple stepObject(const View::Slice& slice, std::uint64_t size) {
    return py::make_tuple("slice", slice.first, slice.step, size);
}

py::tuple stepObject(const KeyedPermutation& order, std::uint64_t) {
    return py::make_tuple("shuffled", order.key());
}

py::tuple stepObject(const View::Selection& selection, std::uint64_t) {
    return py::make_tuple("select", arrayOf(*selection));
}

}  // namespace

py::list stepsOf(const View& view) {
    py::list list;
    for (const View::Step& step : view.steps())
        list.append(std::visit(
            [&](const auto& map) { return stepObject(map, step.size); },
            step.map));
    return list;
}

// ---- The class ----

namespace {

IndexArray numbersAt(const View& view, const IndexArray& indices) {
    std::vector<std::uint64_t> numbers = fromStart(view.size(), indices);
    {
        const InterpreterReleased released;
        view.toNumbers(numbers);
    }
    return arrayOf(numbers);
}

IndexArray indicesOf(const View& view, std::vector<std::uint64_t> numbers) {
    std::vector<std::uint64_t> indices;
    {
        const InterpreterReleased released;
        indices = view.indicesOf(std::move(numbers));
    }
    return arrayOf(indices);
}

}  // namespace

void bindView(py::module_& module) {
    py::class_<View> type(module, "View");
    type.def(py::init<std::uint64_t>())
        .def("__len__", &View::size)
        .def_property_readonly("domain", &View::domain)
        .def_property_readonly("start", &View::start)
        .def("number",
             [](const View& view, const py::object& index) {
                 return view[fromStart(view.size(), index)];
             })
        .def("numbers", &numbersAt)
        .def("indices_of", [](const View& view, const IndexArray& numbers) {
            return indicesOf(view, fromStart(view.domain(), numbers));
        });
    bindViews(
        type, [](const View& view) -> const View& { return view; },
        [](const View&, View view) { return view; });
}

}  // namespace tessel::python
