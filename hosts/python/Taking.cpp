#include "hosts/python/Taking.hpp"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <string>
#include <string_view>
#include <utility>

#include "hosts/python/Chunks.hpp"
#include "paths/PathList.hpp"
#include "paths/PathText.hpp"

namespace tessel::python {

namespace {

namespace py = pybind11;

using Indices = std::vector<std::uint64_t>;

paths::PathList textsAt(const PathSequence& paths, const Indices& indices,
                        NumberRange chunk) {
    paths::PathList texts;
    const auto* const begin = indices.data();
    paths.read(Indices(begin + chunk.begin, begin + chunk.end),
               [&](std::string_view path) { texts.append(path); });
    return texts;
}

// Shows each chunk of indices to consume(chunk, produce(chunk)).
template <class Result, class Produce, class Consume>
void readChunks(const PathSequence& paths, const Indices& indices,
                Produce produce, Consume consume) {
    inChunks<Result>(indices.size(), pathsPerChunk(indices.size()), produce,
                     consume);
    paths.endReading(indices.size());
}

// ---- Arrays of fixed width ----

// Calls visit(char32_t) for each of the code points that Python sees.
template <class Visit>
void forEachCodePoint(std::string_view path, Visit visit) {
    while (!path.empty()) {
        const auto next = paths::decodeCharacter(path);
        const char32_t first = next.units[0];
        if (next.unitCount == 1)
            visit(first);
        else
            visit(0x10000 + ((first - 0xD800U) << 10U) +
                  (char32_t{next.units[1]} - 0xDC00U));
        path.remove_prefix(next.byteCount);
    }
}

// Characters that a path takes in an array.
std::size_t widthOf(std::string_view path, PathKind kind) {
    if (kind == PathKind::Bytes) return path.size();
    std::size_t width = 0;
    forEachCodePoint(path, [&](char32_t) { ++width; });
    return width;
}

// The paths of a chunk, and the width of the longest.
struct Column {
    paths::PathList texts;
    std::size_t width = 1;  // NumPy has no narrower one
};

Column columnOf(paths::PathList texts, PathKind kind) {
    Column column{std::move(texts)};
    for (std::size_t i = 0; i < column.texts.size(); ++i)
        column.width = std::max(column.width, widthOf(column.texts[i], kind));
    return column;
}

void put(std::string_view path, PathKind kind, char* into) {
    if (kind == PathKind::Bytes) {
        std::memcpy(into, path.data(), path.size());
        return;
    }
    forEachCodePoint(path, [&](char32_t point) {
        std::memcpy(into, &point, sizeof point);
        into += sizeof point;
    });
}

// Writes the paths of all columns into an array of zeros, which has an item
// for each.
void fill(py::array array, const std::vector<Column>& columns, PathKind kind) {
    const auto itemBytes = static_cast<std::size_t>(array.itemsize());
    auto* const items = static_cast<char*>(array.mutable_data());
    std::vector<std::size_t> starts;  // of each column
    std::size_t size = 0;
    for (const Column& column : columns) {
        starts.push_back(size);
        size += column.texts.size();
    }
    const auto write = [&](NumberRange chunk) {
        const paths::PathList& texts = columns[chunk.begin].texts;
        char* into = items + starts[chunk.begin] * itemBytes;
        for (std::size_t i = 0; i < texts.size(); ++i, into += itemBytes)
            put(texts[i], kind, into);
        return 0;
    };
    inChunks<int>(columns.size(), 1, write, [](NumberRange, int) {});
}

}  // namespace

py::list takeList(const PathSequence& paths, const Indices& indices,
                  PathKind kind) {
    py::list list(static_cast<py::ssize_t>(indices.size()));
    readChunks<paths::PathList>(
        paths, indices,
        [&](NumberRange chunk) { return textsAt(paths, indices, chunk); },
        [&](NumberRange chunk, const paths::PathList& texts) {
            for (std::size_t i = 0; i < texts.size(); ++i)
                PyList_SET_ITEM(list.ptr(),
                                static_cast<py::ssize_t>(chunk.begin + i),
                                toObject(texts[i], kind).release().ptr());
        });
    return list;
}

py::array takeArray(const PathSequence& paths, const Indices& indices,
                    PathKind kind) {
    std::vector<Column> columns;
    std::size_t width = 1;
    readChunks<Column>(
        paths, indices,
        [&](NumberRange chunk) {
            return columnOf(textsAt(paths, indices, chunk), kind);
        },
        [&](NumberRange, Column column) {
            width = std::max(width, column.width);
            columns.push_back(std::move(column));
        });
    const char* const letter = kind == PathKind::Bytes ? "S" : "U";
    py::array array = py::module_::import("numpy").attr("zeros")(
        indices.size(), letter + std::to_string(width));
    fill(array, columns, kind);
    return array;
}

}  // namespace tessel::python
