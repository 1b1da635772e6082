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

// Shows the paths of each chunk of indices to consume(chunk, texts).
template <class Consume>
void readChunks(const PathSequence& paths, const Indices& indices,
                Consume consume) {
    const auto read = [&](NumberRange chunk) {
        paths::PathList texts;
        const auto* const begin = indices.data();
        paths.read(Indices(begin + chunk.begin, begin + chunk.end),
                   [&](std::string_view path) { texts.append(path); });
        return texts;
    };
    inChunks<paths::PathList>(indices.size(), pathsPerChunk(indices.size()),
                              read, consume);
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

std::size_t widthOf(const std::vector<paths::PathList>& lists, PathKind kind) {
    std::size_t width = 1;  // NumPy has no narrower one
    for (const auto& texts : lists)
        for (std::size_t i = 0; i < texts.size(); ++i)
            width = std::max(width, widthOf(texts[i], kind));
    return width;
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

}  // namespace

py::list takeList(const PathSequence& paths, const Indices& indices,
                  PathKind kind) {
    py::list list(static_cast<py::ssize_t>(indices.size()));
    readChunks(
        paths, indices, [&](NumberRange chunk, const paths::PathList& texts) {
            for (std::size_t i = 0; i < texts.size(); ++i)
                PyList_SET_ITEM(list.ptr(),
                                static_cast<py::ssize_t>(chunk.begin + i),
                                toObject(texts[i], kind).release().ptr());
        });
    return list;
}

py::array takeArray(const PathSequence& paths, const Indices& indices,
                    PathKind kind) {
    std::vector<paths::PathList> lists;
    readChunks(paths, indices, [&](NumberRange, paths::PathList texts) {
        lists.push_back(std::move(texts));
    });
    const std::size_t width = widthOf(lists, kind);
    const char* const letter = kind == PathKind::Bytes ? "S" : "U";
    py::array array(py::dtype(letter + std::to_string(width)),
                    static_cast<py::ssize_t>(indices.size()));
    const auto itemBytes = static_cast<std::size_t>(array.itemsize());
    auto* into = static_cast<char*>(array.mutable_data());
    const py::gil_scoped_release released;
    std::memset(into, 0, itemBytes * indices.size());
    for (const auto& texts : lists)
        for (std::size_t i = 0; i < texts.size(); ++i, into += itemBytes)
            put(texts[i], kind, into);
    return array;
}

}  // namespace tessel::python
