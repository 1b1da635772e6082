#pragma once

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <cstdint>
#include <vector>

#include "hosts/python/PathObjects.hpp"
#include "hosts/python/PathSequence.hpp"

namespace tessel::python {

// Many paths at once, as Python keeps them. All of them read on all cores and
// let Ctrl-C end them; see Chunks.hpp for locks. The indices must be below the
// list's size.

// A list of objects.
pybind11::list takeList(const PathSequence& paths,
                        const std::vector<std::uint64_t>& indices,
                        PathKind kind);

// A NumPy array of fixed width, that of the longest path: of bytes ("S") or of
// UTF-32 ("U").
pybind11::array takeArray(const PathSequence& paths,
                          const std::vector<std::uint64_t>& indices,
                          PathKind kind);

}  // namespace tessel::python
