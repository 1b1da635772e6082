#pragma once

#include <pybind11/pybind11.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <optional>
#include <stop_token>
#include <string>
#include <string_view>
#include <vector>

#include "archive/ArchiveWriter.hpp"
#include "hosts/python/PathSequence.hpp"
#include "packing/FunctionRef.hpp"
#include "paths/PathList.hpp"

namespace tessel::python {

// Packer writes a list's archive to a file or to memory. Python's signals and
// the progress function are served while it works; without finish() it leaves
// no trace.
//
// Threads: one thread at a time, which holds the interpreter's lock.
// Errors: FileException; std::invalid_argument and std::length_error, which
//   name the path's position; DamagedListException of a list that is read;
//   what Python raises. Afterwards it can only be destroyed.
class Packer {
public:
    // file      the archive to write; empty: in memory
    // progress  None, or called with paths packed and paths added
    Packer(std::string file, ArchiveLevel level, ArchiveIndex index,
           pybind11::object progress);

    // Starts with the paths of a list, whose bytes are kept: those of the file
    // if that is where it is, otherwise in memory. What is added gets an index
    // if the list has one. Throws std::invalid_argument if the file has
    // changed since the list was opened.
    static std::unique_ptr<Packer> appendTo(const StoredList& list,
                                            pybind11::object progress);

    Packer(const Packer&) = delete;
    Packer& operator=(const Packer&) = delete;
    ~Packer() = default;

    // Adds paths of any kind that PathBytes takes, batch by batch.
    void addIterable(const pybind11::iterable& paths);
    void addSequence(const PathSequence& paths);

    // Adds the lines of a file, or its records if it holds a NUL; of an
    // archive, its paths.
    void addListFile(const std::string& file);

    // Adds all files below a folder, as walkFolder shows them. Returns what
    // was left out.
    paths::WalkReport addFolder(const std::string& folder);

    // Puts the archive in place and opens it.
    StoredList::Pointer finish();

private:
    // Paths that are taken from Python, or read from a list, at a time: a few
    // milliseconds, so that Ctrl-C is answered, and some hundred times what it
    // costs to start a thread.
    static constexpr std::uint64_t pathsPerBatch = 16384;

    Packer(std::string file, pybind11::object progress)
        : file_(std::move(file)), progress_(std::move(progress)) {}

    ArchiveOptions options(ArchiveLevel level, ArchiveIndex index);
    void run(FunctionRef<void()> work);
    void report();
    void addPath(std::string_view path);
    void addBatch(const paths::PathList& batch);

    std::string file_;
    std::vector<std::uint8_t> bytes_;  // the archive, if there is no file
    pybind11::object progress_;
    std::stop_source stop_;
    // Written by the working thread, read by the calling one; relaxed: each is
    // a number by itself.
    std::atomic<std::uint64_t> packed_ = 0;
    std::atomic<std::uint64_t> added_ = 0;
    std::optional<ArchiveWriter> writer_;
};

}  // namespace tessel::python
