#pragma once

#include <pybind11/pybind11.h>

#include <algorithm>
#include <cstdint>
#include <utility>
#include <vector>

#include "archive/NumberRange.hpp"
#include "archive/OrderedScan.hpp"
#include "hosts/python/InterpreterLock.hpp"

namespace tessel::python {

// Works on the numbers below `count`, a chunk at a time, on all cores:
// `produce` makes a Result of each chunk on any thread, without the
// interpreter's lock. `consume` gets the results in ascending order on the
// calling thread, under the lock. Before each of its calls, Python handles
// signals, so that Ctrl-C ends the work by an exception.
//
// The calling thread must hold the interpreter's lock. What either function
// throws is thrown here, after all threads have ended.
//
// perChunk  numbers in a chunk; it should take some 1 to 100 milliseconds
template <class Result, class Produce, class Consume>
void inChunks(std::uint64_t count, std::uint64_t perChunk, Produce produce,
              Consume consume) {
    const NumberRange all{0, count};
    const auto chunkAt = [&](std::uint64_t i) {
        return archive::chunkOf(all, perChunk, i);
    };
    const InterpreterReleased released;
    const ScanOptions options;
    archive::OrderedScan scan(archive::chunkCount(all, perChunk), options);
    std::vector<Result> results(scan.slots());
    const auto finish = [&](std::uint64_t i) {
        const InterpreterHeld held;
        if (PyErr_CheckSignals() != 0) throw pybind11::error_already_set();
        consume(chunkAt(i), std::exchange(results[i % scan.slots()], {}));
        return true;
    };
    scan.run(
        [&](std::uint64_t i) {
            results[i % scan.slots()] = produce(chunkAt(i));
        },
        finish);
}

// Paths per chunk for reading: as many as one batch of the archive's reader
// takes at most, so that scattered paths share the decoding of their blocks;
// fewer if there are fewer, so that all cores have some.
inline std::uint64_t pathsPerChunk(std::uint64_t count) noexcept {
    return std::clamp<std::uint64_t>(count / 8, 1024, 65536);
}

}  // namespace tessel::python
