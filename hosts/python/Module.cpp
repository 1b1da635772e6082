// The module qztessel._core: what of the library Python's part of the package
// builds on. Its functions take checked arguments and are no public interface;
// qztessel/_core.pyi has their types.
#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>
#include <pybind11/stl.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <optional>
#include <span>
#include <stop_token>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "hosts/python/Errors.hpp"
#include "hosts/python/InterpreterLock.hpp"
#include "hosts/python/Interruptible.hpp"
#include "hosts/python/Packer.hpp"
#include "hosts/python/PathObjects.hpp"
#include "hosts/python/PathSequence.hpp"
#include "hosts/python/Searching.hpp"
#include "hosts/python/StoredList.hpp"
#include "hosts/python/Taking.hpp"
#include "hosts/python/ViewObjects.hpp"
#include "paths/WholeFile.hpp"

namespace tessel::python {

namespace {

namespace py = pybind11;

PathKind kindOf(bool asBytes) noexcept {
    return asBytes ? PathKind::Bytes : PathKind::Text;
}

// ---- Archives ----

// Python holds no pointers to const. All members are const.
std::shared_ptr<StoredList> shared(StoredList::Pointer list) {
    return std::const_pointer_cast<StoredList>(std::move(list));
}

// Keeps an object's buffer; releases it under the interpreter's lock.
std::shared_ptr<const void> keeping(py::buffer_info info) {
    const auto release = [](py::buffer_info* kept) {
        const InterpreterHeld held;
        const std::unique_ptr<py::buffer_info> owner(kept);
    };
    return std::shared_ptr<py::buffer_info>(
        std::make_unique<py::buffer_info>(std::move(info)).release(), release);
}

// Copies bytes that somebody could change.
std::shared_ptr<StoredList> listOver(const py::buffer& buffer) {
    py::buffer_info info = buffer.request();
    if (PyBuffer_IsContiguous(info.view(), 'C') == 0)
        throw py::value_error("the buffer of a list has gaps; give its bytes");
    const auto* const data = static_cast<const std::uint8_t*>(info.ptr);
    const auto size = static_cast<std::size_t>(info.size * info.itemsize);
    const std::span<const std::uint8_t> bytes(data, size);
    if (!info.readonly)
        return shared(StoredList::own({bytes.begin(), bytes.end()}));
    return shared(StoredList::over(bytes, keeping(std::move(info))));
}

py::buffer_info bufferOf(const StoredList& list) {
    // Python takes a pointer to changeable bytes, and a flag that they are not.
    return {const_cast<std::uint8_t*>(list.bytes().data()),
            static_cast<py::ssize_t>(list.bytes().size()), true};
}

void bindStoredList(py::module_& module) {
    py::class_<StoredList, std::shared_ptr<StoredList>>(module, "StoredList",
                                                        py::buffer_protocol())
        .def_buffer(&bufferOf)
        .def_property_readonly(
            "file",
            [](const StoredList& list) { return py::bytes(list.file()); })
        .def_property_readonly(
            "nbytes",
            [](const StoredList& list) { return list.bytes().size(); })
        .def_property_readonly("sum", [](const StoredList& list) {
            return list.archive().info().sum;
        });
    module.def(
        "open",
        [](const std::string& file) { return shared(StoredList::open(file)); },
        py::call_guard<InterpreterReleased>());
    module.def("over", &listOver);
}

// ---- Lists ----

py::object pathAt(const PathSequence& paths, const py::object& number,
                  bool asBytes) {
    return toObject(paths[fromStart(paths.size(), number)], kindOf(asBytes));
}

py::list blockOf(const PathSequence& paths, std::uint64_t first,
                 std::uint64_t last, bool asBytes) {
    paths::PathList texts;
    {
        const InterpreterReleased released;
        paths.read(first, last,
                   [&](std::string_view path) { texts.append(path); });
        paths.endReading(last - first);
    }
    py::list list;
    appendObjects(texts, kindOf(asBytes), list);
    return list;
}

std::vector<std::uint64_t> indicesOf(const PathSequence& paths,
                                     py::object path) {
    const std::string text(PathBytes(std::move(path)).view());
    std::vector<std::uint64_t> indices;
    std::stop_source stop;
    runInterruptibly(
        stop, [&] { indices = paths.indicesOf(text); }, [] {});
    return indices;
}

bool contains(const PathSequence& paths, py::object path) {
    const std::string text(PathBytes(std::move(path)).view());
    const InterpreterReleased released;
    return paths.contains(text);
}

bool equals(const PathSequence& left, const PathSequence& right) {
    if (left.size() != right.size()) return false;
    bool equal = false;
    std::stop_source stop;
    runInterruptibly(
        stop, [&] { equal = areEqual(left, right, stop.get_token()); }, [] {});
    left.endReading(left.size());
    right.endReading(right.size());
    return equal;
}

// ---- In bulk ----

IndexArray numbersOf(const PathSequence& paths, const py::iterable& asked) {
    paths::PathList texts;
    for (const py::handle item : asked) {
        // 4,096 paths take about half a millisecond.
        if (texts.size() % 4096 == 0 && PyErr_CheckSignals() != 0)
            throw py::error_already_set();
        const PathBytes path(py::reinterpret_borrow<py::object>(item));
        // NUL is in no list, and no more is the empty path.
        texts.append(path.view().empty() ? std::string_view("\0", 1)
                                         : path.view());
    }
    return arrayOf(firstIndicesOf(paths, texts));
}

patterns::PathMatcher matcherOf(const std::string& pattern,
                                patterns::PatternKind kind, bool ignoreCase) {
    return {{pattern},
            kind,
            ignoreCase ? patterns::LetterCase::Ignored
                       : patterns::LetterCase::Exact};
}

// match  nothing, or "glob" or "regex" and the pattern
IndexArray find(const PathSequence& paths, std::vector<std::string> texts,
                const std::optional<std::pair<std::string, std::string>>& match,
                std::optional<std::string> folder, bool ignoreCase) {
    Query query{std::move(texts), std::nullopt, std::move(folder)};
    if (match) {
        const auto kind = match->first == "glob"
                              ? patterns::PatternKind::Glob
                              : patterns::PatternKind::Expression;
        query.matcher = matcherOf(match->second, kind, ignoreCase);
    }
    return arrayOf(findPaths(paths, query));
}

py::list folderList(const PathSequence& paths, bool asBytes) {
    py::list list;
    for (const std::string& folder : foldersOf(paths))
        list.append(toObject(folder, kindOf(asBytes)));
    return list;
}

using PathSequenceClass = py::class_<PathSequence>;

void bindBulk(PathSequenceClass& type) {
    type.def("take_list",
             [](const PathSequence& paths, const IndexArray& indices,
                bool asBytes) {
                 return takeList(paths, fromStart(paths.size(), indices),
                                 kindOf(asBytes));
             })
        .def("take_array",
             [](const PathSequence& paths, const IndexArray& indices,
                bool asBytes) {
                 return takeArray(paths, fromStart(paths.size(), indices),
                                  kindOf(asBytes));
             })
        .def("numbers", &numbersOf)
        .def("find", &find)
        .def("folders", &folderList);
}

void bindPathSequence(py::module_& module) {
    PathSequenceClass type(module, "PathSequence");
    type.def(py::init([](const std::shared_ptr<StoredList>& stored) {
            return PathSequence(stored);
        }))
        .def("__len__", &PathSequence::size)
        .def("at", &pathAt)
        .def("block", &blockOf)
        .def("indices_of", &indicesOf)
        .def("contains", &contains)
        .def("equals", &equals)
        .def_property_readonly("stored", [](const PathSequence& paths) {
            return shared(paths.stored());
        });
    bindViews(
        type,
        [](const PathSequence& paths) -> const View& { return paths.view(); },
        [](const PathSequence& paths, View view) {
            return PathSequence(paths.stored(), std::move(view));
        });
    bindBulk(type);
}

// ---- Packing ----

void bindPacker(py::module_& module) {
    py::enum_<ArchiveLevel>(module, "Level")
        .value("fast", ArchiveLevel::Fast)
        .value("normal", ArchiveLevel::Normal)
        .value("best", ArchiveLevel::Best);
    py::class_<Packer>(module, "Packer")
        .def(py::init([](std::string file, ArchiveLevel level, bool index,
                         py::object progress) {
            return std::make_unique<Packer>(
                std::move(file), level,
                index ? ArchiveIndex::WhereNeeded : ArchiveIndex::None,
                std::move(progress));
        }))
        .def_static("append_to", &Packer::appendTo)
        .def("add_iterable", &Packer::addIterable)
        .def("add_sequence", &Packer::addSequence)
        .def("add_list_file", &Packer::addListFile)
        .def("add_folder",
             [](Packer& packer, const std::string& folder) {
                 const auto report = packer.addFolder(folder);
                 return py::make_tuple(report.foldersSkipped,
                                       py::bytes(report.firstSkipped),
                                       report.firstReason);
             })
        .def("finish", [](Packer& packer) { return shared(packer.finish()); });
}

// ---- Other files ----

void replaceFile(const std::string& file, std::string_view content) {
    const InterpreterReleased released;
    namingArchive(file, [&] {
        paths::replaceFile(
            file, {reinterpret_cast<const std::uint8_t*>(content.data()),
                   content.size()});
    });
}

}  // namespace

PYBIND11_MODULE(_core, module) {
    registerErrors(module);
    bindStoredList(module);
    bindView(module);
    bindPathSequence(module);
    bindPacker(module);
    module.def("replace_file", &replaceFile);
}

}  // namespace tessel::python
